#include "cli/Conversion.h"

#include <iostream>
#include <optional>
#include <system_error>

#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/Reasons.h"

namespace tallowmere::cli {

int Convert(const ItemsToAsk& toAsk, const std::string& key, const Ask& ask) {
  Client client(toAsk.client);
  Report report(toAsk.format, key);
  if (const auto error = WhyItDoesNotAnswer(client)) return Complain(*error);
  Batch batch(client);
  Items items(toAsk.items, toAsk.format.InputEnd());
  const auto answerAll = [&] {
    batch.Finish();
    std::cout.flush();
  };
  while (report.GoesOn()) {
    const auto item = items.Next(answerAll);
    if (!item) break;
    if (item->empty()) {
      Refuse(batch, *item, kEmptyItem, report);
    } else {
      ask(batch, *item, report);
    }
    report.ShowProgress(items.Done());
  }
  if (report.GoesOn()) batch.Finish();
  const int status = report.Finish();
  if (const int error = items.ReadError()) {
    return Complain("standard input: " + std::generic_category().message(error));
  }
  return status;
}

std::optional<std::string> WhyItDoesNotAnswer(Client& client) {
  const auto answer = client.GetHFSVolumeName(0);
  return answer ? std::nullopt : std::optional(answer.Failure().message);
}

void Refuse(Batch& batch, const std::string& item, const std::string& reason, Report& report) {
  batch.Add(Request<std::optional<std::string>>(std::nullopt),
            [item, reason, &report](const auto&) { report.Fail(item, reason); });
}

}  // namespace tallowmere::cli
