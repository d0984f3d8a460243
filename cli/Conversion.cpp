#include "cli/Conversion.h"

#include <unistd.h>

#include <iostream>
#include <optional>
#include <system_error>

#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/ProgressBar.h"
#include "cli/Reasons.h"

namespace tallowmere::cli {

int Convert(const ItemsToAsk& toAsk, const std::string& key, const Ask& ask) {
  Client client(toAsk.client);
  Batch batch(client);
  Report report(toAsk.format, key);
  Items items(toAsk.items, toAsk.format.Separator());
  // Where the answers can be seen they are progress enough.
  const bool showsProgress = isatty(STDOUT_FILENO) == 0;
  ProgressBar bar;
  std::size_t count = 0;
  while (report.GoesOn()) {
    if (items.WouldWait()) {
      batch.Finish();
      std::cout.flush();
    }
    const auto item = items.Next();
    if (!item) break;
    if (item->empty()) {
      Refuse(batch, *item, kEmptyItem, report);
    } else {
      ask(batch, *item, report);
    }
    if (showsProgress) bar.Show(items.Done(), std::to_string(++count) + " items");
  }
  if (report.GoesOn()) batch.Finish();
  bar.Hide();
  if (const int error = items.ReadError()) {
    return Complain("standard input: " + std::generic_category().message(error));
  }
  return report.Finish();
}

void Refuse(Batch& batch, const std::string& item, const std::string& reason, Report& report) {
  batch.Add(Request<std::optional<std::string>>(std::nullopt),
            [item, reason, &report](const auto&) { report.Fail(item, reason); });
}

}  // namespace tallowmere::cli
