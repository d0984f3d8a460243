#include "cli/Conversion.h"

#include <iostream>
#include <memory>
#include <utility>
#include <vector>

#include "cli/Crew.h"
#include "cli/Items.h"
#include "cli/Output.h"
#include "cli/Report.h"
#include "cli/Services.h"

namespace tallowmere::cli {
namespace {

// What one service is asked at a time: enough that waiting for its last answer costs little, and
// little enough for memory.
constexpr std::size_t kMostItems = 1024;
constexpr std::size_t kMostBytes = 1 << 18;

struct Piece {
  std::vector<std::string> items;
  std::vector<Finding> findings;
  std::size_t size = 0;  // of the items, in bytes

  bool IsFull() const { return items.size() >= kMostItems || size >= kMostBytes; }
};

void Work(Client& client, const Ask& ask, Piece& piece) {
  piece.findings.resize(piece.items.size());
  Converter converter(client);
  for (std::size_t i = 0; i < piece.items.size(); ++i) {
    ask(converter, piece.items[i], piece.findings[i]);
  }
  converter.Finish();
}

}  // namespace

int Convert(const ItemsToAsk& toAsk, const Ask& ask) {
  Report report(toAsk.format);
  auto first = std::make_shared<Client>(toAsk.client);
  if (const auto error = WhyItDoesNotAnswer(*first)) return Complain(*error);

  const auto hire = [&]() -> Crew<Piece>::Work {
    auto client = std::exchange(first, nullptr);
    if (!client) {
      client = std::make_shared<Client>(toAsk.client);
      if (WhyItDoesNotAnswer(*client)) return nullptr;
    }
    return [&ask, client](Piece& piece) { Work(*client, ask, piece); };
  };
  Crew<Piece> crew(MostServices, hire, [&report](Piece& piece) {
    for (const Finding& finding : piece.findings) report.Print(finding);
  });
  Piece piece;
  const auto give = [&] {
    if (!piece.items.empty()) crew.Give(std::exchange(piece, {}));
  };
  Items items(toAsk.items, toAsk.format.InputEnd());
  const auto answerAll = [&] {
    give();
    crew.Finish();
    std::cout.flush();
  };
  while (report.GoesOn()) {
    auto item = items.Next(answerAll);
    if (!item) break;
    piece.size += item->size();
    piece.items.push_back(*std::move(item));
    if (piece.IsFull()) give();
    report.ShowProgress(items.Done());
  }
  if (report.GoesOn()) answerAll();
  return report.Finish(items);
}

std::optional<std::string> WhyItDoesNotAnswer(Client& client) {
  const auto answer = client.GetHFSVolumeName(0);
  return answer ? std::nullopt : std::optional(answer.Failure().message);
}

}  // namespace tallowmere::cli
