// A file or folder, named by a URL.
//
// A reference is empty or holds one URL, which its copies share. Beside it stand three copies of
// the same identity, filled when asked for: the POSIX path, the FSRef and the FSSpec. Queries write
// them, so one reference belongs to one thread at a time, even for queries.
//
// No operation throws, logs or retries, but for what the standard library throws (no memory, a
// std::string of no path). A setter or an edit that fails leaves the reference empty unless its
// comment says otherwise.
//
// A relative path is that of an item in the directory that was current when the URL was made; a
// setter or an edit that makes a URL anew takes the one that is current then. Of a URL that is no
// file's (another scheme or host) the path, the existence and the kind are those of the file with
// its path; it has no FSRef and no node id.
//
// "Path" without more is the POSIX path in the form that the file system stores: NUL-terminated
// bytes. Sizes are in bytes.
#pragma once

#include <CoreFoundation/CoreFoundation.h>
#include <CoreServices/CoreServices.h>

#include <optional>
#include <string>

// How a path is written. Every value but the first two means Windows.
enum tPathStyle : UInt32 {
  kPathStylePOSIX = 0,    // "/a/b"; when setting, a "~" in front is expanded
  kPathStyleHFS = 1,      // "Volume:a:b"
  kPathStyleWindows = 2,  // "C:\a\b"
};

// What stands for no volume, for no folder and for no item at all.
inline constexpr SInt16 kNoVolume = 32767;
inline constexpr SInt32 kNoFolder = -1;
inline constexpr unsigned long kNoNode = ~0UL;

class CFileRef {
 public:
  // An empty reference, for reading only.
  static const CFileRef None;

  // The encoding that names in 8-bit text are tried in first; at the start 0, Mac Roman.
  static CFStringEncoding mLocalEncoding;

  // --- Life -----------------------------------------------------------------------------------

  CFileRef();
  CFileRef(CFileRef const& source);  // shares the URL, starts with no caches
  CFileRef& operator=(CFileRef const& source);
  ~CFileRef();

  // Writes the empty state over the fields without releasing anything. REQUIRES: fresh storage.
  void Init();

  // Releases what is held; the reference is empty then. Two names for one operation.
  void ReInit();
  void Invalidate();

  // Whether a URL is held. Says nothing about the item.
  bool IsValid() const;

  // Refreshes the cached FSRef. False, with the cache all zero, when there is no such item; false,
  // with the cache as it was, for an empty reference.
  bool UpdateInternalFSRef() const;

  // Writes the item's FSRef. False for a reference without a path, for one whose path begins with
  // "." and for an item that does not exist; the cache is not touched.
  bool GetFSRef(FSRef* item) const;

  // The cached FSRef, refreshed; all zero when there is no such item. Valid like GetPath().
  operator FSRef const&() const;  // NOLINT(google-explicit-constructor)
  operator FSRef const*() const;  // NOLINT(google-explicit-constructor)

  // --- Setting --------------------------------------------------------------------------------
  //
  // A constructor is an empty reference and then the setter with the same arguments. A setter
  // empties the reference, even when an argument is null (which fails), and returns whether a URL
  // is held at the end. `isDirectory` makes the URL one of a folder; nothing is looked up on disk.

  // A path; a "~" or "~user" in front of it is expanded.
  CFileRef(char const* path, bool isDirectory);
  bool Set(char const* path, bool isDirectory);

  // A path in a style; "~" is expanded in the POSIX style alone.
  CFileRef(CFStringRef path, tPathStyle style, bool isDirectory);
  bool Set(CFStringRef path, tPathStyle style, bool isDirectory);

  // The file `name` in a folder, the two joined with "/" as they are; or with a null name the
  // folder. "~" is expanded. REQUIRES: `folder` is not null.
  CFileRef(CFStringRef folder, CFStringRef name);
  bool Set(CFStringRef folder, CFStringRef name);

  // The text of any URL, in UTF-8.
  bool SetFromURLString(std::string const& url);

  // This very URL, shared.
  explicit CFileRef(CFURLRef url);
  bool Set(CFURLRef url);

  // A new URL of the path that `url` has.
  bool Set(CFURLRef url, bool isDirectory);

  // An existing item. Not this reference's own cache, which is emptied before it is read.
  explicit CFileRef(FSRef const* item);
  bool Set(FSRef const* item);

  // A new URL of the path that `source` has. REQUIRES: `source` is another object.
  bool Set(CFileRef const& source, bool isDirectory);

  // --- Path and state -------------------------------------------------------------------------

  // The path in a style, owned by the caller. Null for an empty reference and a path that the style
  // cannot say.
  CFStringRef CopyFileSystemPath(tPathStyle style) const;

  // The absolute path without "/" at its end, except for "/". Null for an empty reference, for one
  // with a relative path and for a path that the file system cannot store. Owned by the reference,
  // valid until it changes or ends.
  char const* GetPath() const;
  operator char const*() const;  // NOLINT(google-explicit-constructor)

  // Copies the path as far as it fits, always NUL-terminated; whether all of it fits. REQUIRES:
  // `buffer` has at least one byte, which is written even when `size` is 0.
  bool GetPath(char* buffer, unsigned long size) const;

  // Throws std::logic_error for a reference without a path.
  operator std::string() const;  // NOLINT(google-explicit-constructor)

  // Whether the item is there; a link is there when its target is, or when its sticky bit is set.
  bool Exists() const;

  // Whether the item itself, links not followed, is a folder; is there and anything else.
  bool IsFolder() const;
  bool IsFile() const;

  // Whether both name one item, however they spell it. Items that cannot both be found are the same
  // when their URLs are equal. Two empty references are equal.
  bool operator==(CFileRef const& other) const;
  bool operator!=(CFileRef const& other) const;

  // Whether the other path is this one or lies below it, letter case ignored. "/" contains
  // itself and paths that begin with "//".
  bool PathContains(CFileRef const& other) const;

  // Writes the path and whether the item exists to std::cout, for debugging. The path of a
  // reference without one leaves the stream failed.
  void Trace() const;

  // Whether the workspace shows the item as one document.
  bool IsExistingPackage() const;

  // --- Names and extensions -------------------------------------------------------------------
  //
  // The Copy operations give the platform's view. For the others, the extension is what follows
  // the last "." of the name: ".profile" has one, and "a." an empty one.

  // The last component, owned by the caller; null for an empty reference or a URL without a path.
  CFStringRef CopyFileName() const;

  // Copies the name as far as it fits, always NUL-terminated. True when the name has at most `size`
  // bytes; one of exactly `size` bytes loses its last. False, with the buffer untouched, for a name
  // beyond 1023 bytes or that no file can have. REQUIRES: `name` is not null, and NUL-terminated
  // text when `size` is 0; that text loses the "/" at its end.
  bool GetFileName(char* name, long size) const;

  // Whether there is a name that a file can have, of at most 1023 bytes.
  bool HasValidName() const;

  // The platform's extension, owned by the caller; null when there is none.
  CFStringRef CopyFileExtension() const;

  // Copies the extension without its ".", the rest of the buffer filled with NUL. False, with the
  // buffer untouched, for null, for no extension, and for one that does not fit.
  bool GetExtension(char* extension, unsigned long size) const;

  // The extension without its "."; false, with the string untouched, when there is none.
  bool GetExtension(std::string& extension) const;

  // Whether the wanted extension, with or without a "." in front, begins with the name's, letter
  // case ignored. False for an empty one and for a name's extension beyond 19 bytes.
  bool HasExtension(std::string const& extension) const;

  // Renames the reference so that its name has the extension, given with or without a "." in
  // front. An empty one cuts the extension off with its ".", or adds a "." where there is none. The
  // URL is then one of a file. Without a name the reference stays as it is.
  void ReplaceExtensionBy(std::string const& extension);

  // --- Editing --------------------------------------------------------------------------------
  //
  // True when the reference names the new item. What is null or cannot be joined leaves a reference
  // that holds a URL as it was; a URL that cannot be made leaves it empty. `char const*` is UTF-8.

  // Adds a component, or several with "/" between them, as it stands. An empty reference takes the
  // component for its path, "~" expanded. REQUIRES: not null when a URL is held.
  bool AddToPath(CFStringRef component, bool isDirectory);

  // Adds the other's last component, a folder if that is one. An empty reference is refused.
  bool AddToPath(CFileRef const& other);
  bool AddToPath(char const* component, bool isDirectory);

  // Puts a name in the place of the last component. An empty reference takes the name for its path,
  // "~" expanded, unless `isDirectory` is set: then it is refused.
  bool ReplaceName(CFStringRef name, bool isDirectory);
  bool ReplaceName(CFileRef const& other);
  bool ReplaceName(char const* name, bool isDirectory);

  // Names the containing folder; of "/" that is "/". Empty when it has no absolute path.
  void SetToParent();

  // Names what an alias or a symbolic link points to, one link at a time. False, with the reference
  // as it was, when the item is neither. A relative link text becomes a relative path as it stands.
  bool ResolveAlias(bool allowInteraction);

  // --- Volume and folder ----------------------------------------------------------------------
  //
  // Ids are 32 bits wide. The signed results are ids as an FSSpec holds them, so one from
  // 0x80000000 on is negative; GetNodeID() gives the same id unsigned. Where an id is an argument
  // its lower 32 bits count, so both forms are taken.

  // The volume that has the item, or the one that would: for an item that does not exist, that of
  // the volume root above its path. kNoVolume on failure.
  short GetVolumeRefNumber() const;

  // The id of the folder that holds the item or would; kNoFolder when that is no folder on disk.
  long GetParentID() const;

  // A folder's own id; for everything else GetParentID().
  long GetDirectoryID() const;

  // The id of an existing item; kNoNode on failure.
  unsigned long GetNodeID() const;

  // Whether the item is the top folder of a file system: its parent is on another device, or is the
  // item itself.
  bool IsRoot() const;

  // Writes the name as UTF-16. That of an existing item is the catalog's, in which ':' and '/' are
  // exchanged; any other is the last component as it stands. False, with the record as it was, for
  // an empty reference and for a component of more than 255 units.
  bool UnicodeFileName(HFSUniStr255* name) const;

  // --- FSSpec ---------------------------------------------------------------------------------
  //
  // The empty FSSpec has kNoVolume, kNoFolder and a name of length 0. Where a record is an
  // argument, a name length above 63 counts as 63. `last` changes nothing.

  // The record of an existing item is the File Manager's. Any other gets its name, cut to 63 bytes,
  // and the volume and id of what stands where its folder should (the empty ones when nothing
  // does); a file or a link there is not told from a folder. False, with the
  // record untouched, for an empty reference; false as well for an item that the catalog refuses
  // and for a path without a last component. A URL that is no file's, or another machine's, is that
  // of an item that does not exist.
  bool GetFSSpec(FSSpec* spec) const;

  // The cached FSSpec, made anew with GetFSSpec(), whatever that says; valid like GetPath().
  operator FSSpec const&() const;  // NOLINT(google-explicit-constructor)
  operator FSSpec const*() const;  // NOLINT(google-explicit-constructor)

  // The existing item with a name of `nameLength` UTF-16 units in the folder `dirID`; with length 0
  // the folder itself. What cannot be found leaves the reference as it was; an id that is not a
  // folder's, with length 0, leaves it empty.
  CFileRef(short vRefNum, long dirID, unsigned long nameLength, unsigned short const* name,
           bool last);
  bool Set(short vRefNum, long dirID, unsigned long nameLength, unsigned short const* name,
           bool last);

  // An HFS path with its volume's name in front, in mLocalEncoding or the system's. Null fails.
  bool SetFromHFSPath(char const* hfsPath, bool isFolder);

  // What CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC makes of the record; null gives an empty
  // reference. The form for a record that is not const resolves an alias, the others do not.
  CFileRef(FSSpec const* spec, bool searchOtherVolumes, bool last);
  CFileRef(FSSpec const& spec, bool searchOtherVolumes, bool last);
  CFileRef(FSSpec* spec, bool searchOtherVolumes, bool last);
  bool SetFromFSSpec(FSSpec const* spec, bool searchOtherVolumes, bool last);

 private:
  bool Hold(CFURLRef url);  // takes the URL over, into an empty reference; whether it is one
  bool HoldPathOf(CFURLRef url, bool isDirectory);
  bool FollowLink();
  std::optional<bool> ReadIsRoot() const;  // none when it cannot be looked at
  bool IsOfNoFile() const;  // whether it is not this URL that names the item at its path
  bool ClimbToExisting();   // to the item itself if that exists; false, and empty, to none

  CFURLRef mURL;           // one reference of ours; null when empty
  UInt32 mValid;           // 1 exactly when mURL is not null; the lowest bit counts
  mutable char* mPath;     // the path once asked for, from new[]; null before
  mutable FSRef mFSRef;    // rewritten on each use; all zero when there is no such item
  mutable FSSpec mFSSpec;  // rewritten on each use
};

// The URL of a POSIX path, owned by the caller. "~" in front is the home folder of the current
// user, "~name" that of a user; alone, or with nothing behind "/", it is a folder whatever
// `isDirectory` says. Null for an unknown user, an empty path, or what else has no URL. The process
// stops for a null path.
CFURLRef CreateURLByExpandingTildePath(CFStringRef path, bool isDirectory);
