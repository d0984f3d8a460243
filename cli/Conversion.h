// The common loop of the commands that turn items into something else: many are asked at a time, of
// several services, and answers are printed in the items' order.
#pragma once

#include <tallowmere/Converter.h>

#include <functional>
#include <optional>
#include <string>

#include "cli/Commands.h"
#include "cli/Finding.h"

namespace tallowmere::cli {

// Asks about an item, which lives until the answer is there. The answer's handler writes down the
// finding. Called by several threads, each with a converter of its own.
using Ask = std::function<void(Converter& converter, const std::string& item, Finding& finding)>;

// Asks about every item and prints the findings. Returns the program's exit status. What has been
// found is printed before waiting for more standard input.
int Convert(const ItemsToAsk& toAsk, const Ask& ask);

// Why the service does not answer at all; nullopt when it does. Asked once, before all items, so
// that a service that cannot be started is reported once.
std::optional<std::string> WhyItDoesNotAnswer(Client& client);

}  // namespace tallowmere::cli
