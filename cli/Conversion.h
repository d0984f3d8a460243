// The way of every command that turns items into something else: many of them asked at a time,
// answers in their order.
#pragma once

#include <tallowmere/Batch.h>

#include <functional>
#include <optional>
#include <string>

#include "cli/Commands.h"
#include "cli/Report.h"

namespace tallowmere::cli {

// Adds the requests about an item to the batch, whose last handler tells the report.
using Ask = std::function<void(Batch& batch, const std::string& item, Report& report)>;

// Asks about every item and prints the answers; `key` is that of an item in JSON. The program's
// exit status. Standard input that has nothing to give yet holds no answer back.
int Convert(const ItemsToAsk& toAsk, const std::string& key, const Ask& ask);

// Why the service answers nothing at all, if so: asked once before any item, so that a service that
// cannot be started is said once.
std::optional<std::string> WhyItDoesNotAnswer(Client& client);

// Tells the report, behind the answers that are still to come, that the item cannot be asked about.
void Refuse(Batch& batch, const std::string& item, const std::string& reason, Report& report);

}  // namespace tallowmere::cli
