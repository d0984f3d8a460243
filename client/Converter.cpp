#include <tallowmere/Converter.h>

#include <optional>
#include <utility>

#include "client/Conversions.h"
#include "client/Exchange.h"

namespace tallowmere {
namespace {

template <class T>
class PlainQuestion final : public conversion::Inquiry {
 public:
  PlainQuestion(conversion::Exchange& exchange, const Request<T>& request,
                std::function<void(Result<T>)> handler)
      : mHandler(std::move(handler)) {
    exchange.Put(request, *this, mAnswer);
  }
  void Tell(conversion::Exchange& /*exchange*/) override { mHandler(*std::move(mAnswer)); }

 private:
  std::function<void(Result<T>)> mHandler;
  std::optional<Result<T>> mAnswer;
};

class KnownAnswer final : public conversion::Inquiry {
 public:
  explicit KnownAnswer(std::function<void()> handler) : mHandler(std::move(handler)) {}
  void Tell(conversion::Exchange& /*exchange*/) override { mHandler(); }

 private:
  std::function<void()> mHandler;
};

}  // namespace

class Converter::Core final : public conversion::Exchange {
 public:
  using Exchange::Exchange;
};

Converter::Converter(Client& client, ConvertOptions options)
    : mCore(std::make_unique<Core>(client, options.resolve)) {}

Converter::~Converter() = default;

void Converter::RecordOf(PathView path, Handler<FSSpec> handler) {
  mCore->Take(conversion::RecordOf(*mCore, path.Text(), std::move(handler)));
}

void Converter::PathOf(const FSSpec& record, bool searchOtherVolumes,
                       Handler<std::string> handler) {
  mCore->Take(conversion::PathOf(*mCore, record, searchOtherVolumes, std::move(handler)));
}

void Converter::HFSPathOf(PathView path, Handler<std::string> handler) {
  mCore->Take(conversion::HFSPathOf(*mCore, path.Text(), std::move(handler)));
}

void Converter::PathOfHFSPath(std::string_view hfsPath, Handler<std::string> handler) {
  mCore->Take(conversion::PathOfHFSPath(*mCore, hfsPath, std::move(handler)));
}

void Converter::HFSNameOf(PathView path, Handler<std::string> handler) {
  mCore->Take(conversion::HFSNameOf(*mCore, path.Text(), std::move(handler)));
}

void Converter::PathInFolder(PathView folder, std::string_view hfsName,
                             Handler<std::string> handler) {
  mCore->Take(conversion::PathInFolder(*mCore, folder.Text(), hfsName, std::move(handler)));
}

template <class T>
void Converter::Ask(const Request<T>& request,
                    std::type_identity_t<std::function<void(Result<T>)>> handler) {
  mCore->Take(std::make_unique<PlainQuestion<T>>(*mCore, request, std::move(handler)));
}

void Converter::Tell(std::function<void()> handler) {
  mCore->Take(std::make_unique<KnownAnswer>(std::move(handler)));
}

void Converter::Finish() {
  mCore->Finish();
}

// The types of answers to requests; there are no others.
template void Converter::Ask(const Request<std::string>&, std::function<void(Result<std::string>)>);
template void Converter::Ask(const Request<std::optional<std::string>>&,
                             std::function<void(Result<std::optional<std::string>>)>);
template void Converter::Ask(const Request<std::optional<std::int16_t>>&,
                             std::function<void(Result<std::optional<std::int16_t>>)>);
template void Converter::Ask(const Request<std::optional<FSSpec>>&,
                             std::function<void(Result<std::optional<FSSpec>>)>);
template void Converter::Ask(const Request<ExportSettings>&,
                             std::function<void(Result<ExportSettings>)>);

// --- one at a time ---

namespace {

// The answer to the one question that `ask` puts.
template <class T, class Put>
Conversion<T> AskOne(Client& client, ConvertOptions options, Put put) {
  std::optional<Conversion<T>> answer;
  Converter converter(client, options);
  put(converter, [&answer](Conversion<T> result) { answer.emplace(std::move(result)); });
  converter.Finish();
  return *std::move(answer);
}

}  // namespace

Conversion<FSSpec> Client::RecordOf(PathView path, ConvertOptions options) {
  return AskOne<FSSpec>(*this, options, [&](Converter& converter, auto handler) {
    converter.RecordOf(path, std::move(handler));
  });
}

Conversion<std::string> Client::PathOf(const FSSpec& record, bool searchOtherVolumes) {
  return AskOne<std::string>(*this, {}, [&](Converter& converter, auto handler) {
    converter.PathOf(record, searchOtherVolumes, std::move(handler));
  });
}

Conversion<std::string> Client::HFSPathOf(PathView path, ConvertOptions options) {
  return AskOne<std::string>(*this, options, [&](Converter& converter, auto handler) {
    converter.HFSPathOf(path, std::move(handler));
  });
}

Conversion<std::string> Client::PathOfHFSPath(std::string_view hfsPath) {
  return AskOne<std::string>(*this, {}, [&](Converter& converter, auto handler) {
    converter.PathOfHFSPath(hfsPath, std::move(handler));
  });
}

Conversion<std::string> Client::HFSNameOf(PathView path, ConvertOptions options) {
  return AskOne<std::string>(*this, options, [&](Converter& converter, auto handler) {
    converter.HFSNameOf(path, std::move(handler));
  });
}

Conversion<std::string> Client::PathInFolder(PathView folder, std::string_view hfsName,
                                             ConvertOptions options) {
  return AskOne<std::string>(*this, options, [&](Converter& converter, auto handler) {
    converter.PathInFolder(folder, hfsName, std::move(handler));
  });
}

}  // namespace tallowmere
