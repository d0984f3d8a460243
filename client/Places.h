// Where a path leads: resolves the way to an item, and looks once whether the item exists.
#pragma once

#include <tallowmere/Result.h>

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace tallowmere {

// A folder that is held, so that looking at its items costs one short call each.
class Folder {
 public:
  // Takes the descriptor over.
  Folder(std::string path, int descriptor) : mPath(std::move(path)), mDescriptor(descriptor) {}
  Folder(const Folder&) = delete;
  Folder& operator=(const Folder&) = delete;
  ~Folder();

  // Absolute; where it was resolved, without links. Never ends with a slash: empty for "/".
  const std::string& Path() const { return mPath; }
  std::string PathOrRoot() const { return mPath.empty() ? "/" : mPath; }
  // The path of an item in it.
  std::string PathOf(std::string_view name) const;
  int Descriptor() const { return mDescriptor; }

  // Whether a path, without following a link at its end, leads to this folder.
  bool IsAt(const std::string& path) const;

  // The folder's full HFS path, once somebody has asked for it and it has been checked.
  bool hasBeenAsked = false;
  std::optional<Result<std::string>> fullPath;

 private:
  std::string mPath;
  int mDescriptor;
};

// An item, or a place for one.
struct Place {
  std::shared_ptr<Folder> folder;  // that holds it; for "/", "/" itself
  std::string path;                // its path
  std::size_t nameAt;              // where its name begins in that; for "/" the name is empty
  bool exists;
  bool isFolder;

  std::string_view Name() const { return std::string_view(path).substr(nameAt); }
};

// What is at a name in a folder; nothing is followed.
struct Looked {
  bool exists;
  bool isFolder;
};
Result<Looked> LookAt(const Folder& folder, std::string_view name);

// The same for a whole path.
Result<Looked> LookAt(const std::string& path);

// Whether two paths, links at their ends not followed, lead to one item.
bool IsSameItem(const std::string& one, const std::string& other);

// The same for items of one file system.
bool IsSameFileSystem(const std::string& one, const std::string& other);

// The last name of a path, and what is in front of it and its slash.
std::string_view LastNameOf(std::string_view path);
std::string_view FolderOf(std::string_view path);

class Places {
 public:
  explicit Places(bool resolves) : mResolves(resolves) {}

  // Fails for what has no folder.
  Result<Place> Find(std::string_view path);

  // The folder at a path; where ways are resolved, a link to one is followed.
  Result<std::shared_ptr<Folder>> FindFolder(std::string_view path);

  // Lets the folders go.
  void Forget() { mKnown.clear(); }

 private:
  struct Known {
    std::string text;  // as it was asked for, without slashes at the end
    Result<std::shared_ptr<Folder>> folder;
  };

  Result<std::shared_ptr<Folder>> FolderAt(std::string_view path);
  Result<std::shared_ptr<Folder>> Open(const std::string& text);
  std::shared_ptr<Folder> OpenInKnown(const std::string& text);
  Result<Place> FindByWholeWay(std::string_view path);
  static Result<Place> PlaceIn(std::shared_ptr<Folder> folder, std::string_view name);
  std::optional<Error> WhyNoPath(std::string_view path) const;

  bool mResolves;
  std::vector<Known> mKnown;  // the one that was used last at the end
};

}  // namespace tallowmere
