// The common loop of the commands that turn items into something else: many are asked at a time,
// and answers are printed in the items' order.
#pragma once

#include <tallowmere/Batch.h>

#include <functional>
#include <optional>
#include <string>

#include "cli/Commands.h"
#include "cli/Report.h"

namespace tallowmere::cli {

// Adds the requests about an item to the batch; the last handler reports the outcome.
using Ask = std::function<void(Batch& batch, const std::string& item, Report& report)>;

// Asks about every item and prints the answers; `key` is that of an item in JSON. Returns the
// program's exit status. Answers are printed before waiting for more standard input.
int Convert(const ItemsToAsk& toAsk, const std::string& key, const Ask& ask);

// Why the service answers nothing at all, or nullopt. Asked once before all items, so that a
// service that cannot be started is reported once.
std::optional<std::string> WhyItDoesNotAnswer(Client& client);

// Reports, in turn after the answers still to come, that the item cannot be asked about.
void Refuse(Batch& batch, const std::string& item, const std::string& reason, Report& report);

}  // namespace tallowmere::cli
