// Many conversions by one client, several of them under way at a time. Handlers are called in the
// order of the questions, within the calls below.
//
// The way to a folder is looked up once for a run of items in it, and kept for a while, as is its
// full HFS path. A folder that is moved, replaced or mounted over meanwhile, and a change of the
// current folder, show from the next Finish on. For an item in a folder that is known, the system
// is asked once.
#pragma once

#include <tallowmere/Client.h>
#include <tallowmere/Conversion.h>

#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <type_traits>

namespace tallowmere {

class Converter {
 public:
  // Handlers may throw: the exception leaves the call that they are called in, and the questions
  // after it are still asked. They must not use the converter or its client.
  template <class T>
  using Handler = std::function<void(Conversion<T>)>;

  // REQUIRES: the client outlives the converter. From its first request on until it has finished,
  // the converter has the client to itself: see Client.h. It belongs to one thread at a time.
  explicit Converter(Client& client, ConvertOptions options = {});
  Converter(const Converter&) = delete;
  Converter& operator=(const Converter&) = delete;
  // Drops the questions that have not been answered; their handlers are not called.
  ~Converter();

  // See the conversion of the same name in Client.
  void RecordOf(PathView path, Handler<FSSpec> handler);
  void PathOf(const FSSpec& record, bool searchOtherVolumes, Handler<std::string> handler);
  void HFSPathOf(PathView path, Handler<std::string> handler);
  void PathOfHFSPath(std::string_view hfsPath, Handler<std::string> handler);
  void HFSNameOf(PathView path, Handler<std::string> handler);
  void PathInFolder(PathView folder, std::string_view hfsName, Handler<std::string> handler);

  // A request among the conversions, in its turn, as it is.
  template <class T>
  void Ask(const Request<T>& request, std::type_identity_t<std::function<void(Result<T>)>> handler);

  // An answer that is known already, in its turn.
  void Tell(std::function<void()> handler);

  // Returns when every handler has been called, and forgets the folders.
  void Finish();

 private:
  class Core;
  std::unique_ptr<Core> mCore;
};

}  // namespace tallowmere
