// A file or folder, named by a URL.
//
// A reference is empty or holds one URL, which its copies share. It caches the same identity in
// three other forms, filled in on demand: the POSIX path, the FSRef and the FSSpec. Queries write
// these caches, so one reference belongs to one thread at a time, even for queries.
//
// No operation throws, logs or retries, except that the standard library may throw (no memory, a
// std::string without a path). A setter or an edit that fails leaves the reference empty unless its
// comment says otherwise.
//
// A relative path starts at the directory that was current when the URL was made; a setter or an
// edit that makes a new URL uses the one that is current then. For a URL that is not a file's
// (another scheme or host), path, existence and kind are those of the file with the same path; it
// has no FSRef and no node id.
//
// "Path" alone means the POSIX path in the form that the file system stores: NUL-terminated bytes.
// Sizes are in bytes.
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

// These stand for no volume, no folder and no item.
inline constexpr SInt16 kNoVolume = 32767;
inline constexpr SInt32 kNoFolder = -1;
inline constexpr unsigned long kNoNode = ~0UL;

class CFileRef {
 public:
  // An empty reference, to be read only.
  static const CFileRef None;

  // The encoding that is tried first for names in 8-bit text; initially 0, Mac Roman.
  static CFStringEncoding mLocalEncoding;

  // --- Life -----------------------------------------------------------------------------------

  CFileRef();
  CFileRef(CFileRef const& source);  // shares the URL, starts with no caches
  CFileRef& operator=(CFileRef const& source);
  ~CFileRef();

  // Sets the fields to the empty state without releasing anything. REQUIRES: fresh storage.
  void Init();

  // Releases what is held, leaving the reference empty. Two names for one operation.
  void ReInit();
  void Invalidate();

  // Whether a URL is held. Says nothing about the item.
  bool IsValid() const;

  // Refreshes the cached FSRef. Returns false with the cache all zero when there is no such item;
  // returns false with the cache unchanged for an empty reference.
  bool UpdateInternalFSRef() const;

  // Writes the item's FSRef, without touching the cache. Returns false for a reference without a
  // path, for one whose path begins with "." and for an item that does not exist.
  bool GetFSRef(FSRef* item) const;

  // The cached FSRef, refreshed; all zero when there is no such item. Valid like GetPath().
  operator FSRef const&() const;  // NOLINT(google-explicit-constructor)
  operator FSRef const*() const;  // NOLINT(google-explicit-constructor)

  // --- Setting --------------------------------------------------------------------------------
  //
  // A constructor makes an empty reference and calls the setter with the same arguments. A setter
  // first empties the reference, even when an argument is null (which fails), and returns whether a
  // URL is held in the end. `isDirectory` makes the URL that of a folder; nothing is looked up on
  // disk.

  // A path; a "~" or "~user" in front of it is expanded.
  CFileRef(char const* path, bool isDirectory);
  bool Set(char const* path, bool isDirectory);

  // A path in a style; only the POSIX style expands "~".
  CFileRef(CFStringRef path, tPathStyle style, bool isDirectory);
  bool Set(CFStringRef path, tPathStyle style, bool isDirectory);

  // The file `name` in a folder, the two joined with "/" as they are; with a null name, the folder.
  // "~" is expanded. REQUIRES: `folder` is not null.
  CFileRef(CFStringRef folder, CFStringRef name);
  bool Set(CFStringRef folder, CFStringRef name);

  // The text of any URL, in UTF-8.
  bool SetFromURLString(std::string const& url);

  // This very URL, shared.
  explicit CFileRef(CFURLRef url);
  bool Set(CFURLRef url);

  // A new URL with the path of `url`.
  bool Set(CFURLRef url, bool isDirectory);

  // An existing item. Must not be this reference's own cache, which is emptied before it is read.
  explicit CFileRef(FSRef const* item);
  bool Set(FSRef const* item);

  // A new URL with the path of `source`. REQUIRES: `source` is another object.
  bool Set(CFileRef const& source, bool isDirectory);

  // --- Path and state -------------------------------------------------------------------------

  // The path in a style, owned by the caller. Null for an empty reference and for a path that the
  // style cannot express.
  CFStringRef CopyFileSystemPath(tPathStyle style) const;

  // The absolute path without "/" at its end, except for "/". Null for an empty reference, for one
  // with a relative path and for a path that the file system cannot store. Owned by the reference
  // and valid until it changes or is destroyed.
  char const* GetPath() const;
  operator char const*() const;  // NOLINT(google-explicit-constructor)

  // Copies as much of the path as fits, always NUL-terminated; returns whether all of it fits.
  // REQUIRES: `buffer` has at least one byte, which is written even when `size` is 0.
  bool GetPath(char* buffer, unsigned long size) const;

  // Throws std::logic_error for a reference without a path.
  operator std::string() const;  // NOLINT(google-explicit-constructor)

  // Whether the item exists; a link exists when its target does, or when its sticky bit is set.
  bool Exists() const;

  // Whether the item itself, links not followed, is a folder; whether it exists and is anything
  // else.
  bool IsFolder() const;
  bool IsFile() const;

  // Whether both name the same item, however they spell it. Unless both can be found, they are the
  // same when their URLs are equal. Two empty references are equal.
  bool operator==(CFileRef const& other) const;
  bool operator!=(CFileRef const& other) const;

  // Whether the other path is this one or lies below it, ignoring letter case. "/" contains only
  // itself and paths that begin with "//".
  bool PathContains(CFileRef const& other) const;

  // Writes the path and whether the item exists to std::cout, for debugging. A reference without a
  // path leaves the stream in a failed state.
  void Trace() const;

  // Whether the workspace shows the item as one document.
  bool IsExistingPackage() const;

  // --- Names and extensions -------------------------------------------------------------------
  //
  // The Copy operations return the platform's view. For all others, the extension is what follows
  // the last "." of the name: that of ".profile" is "profile", that of "a." is empty.

  // The last component, owned by the caller; null for an empty reference or a URL without a path.
  CFStringRef CopyFileName() const;

  // Copies as much of the name as fits, always NUL-terminated. Returns true when the name has at
  // most `size` bytes; one of exactly `size` bytes loses its last byte. Returns false, with the
  // buffer untouched, for a name that has more than 1023 bytes or that no file can have. REQUIRES:
  // `name` is not null; when `size` is 0, it is NUL-terminated text, which loses any "/" at its
  // end.
  bool GetFileName(char* name, long size) const;

  // Whether the reference has a name that a file can have, of at most 1023 bytes.
  bool HasValidName() const;

  // The platform's extension, owned by the caller; null when there is none.
  CFStringRef CopyFileExtension() const;

  // Copies the extension without its "." and fills the rest of the buffer with NULs. Returns false,
  // with the buffer untouched, for null, for no extension, and for one that does not fit.
  bool GetExtension(char* extension, unsigned long size) const;

  // Stores the extension without its "."; returns false, with the string untouched, when there is
  // none.
  bool GetExtension(std::string& extension) const;

  // Whether `extension`, with or without a leading ".", begins with the name's extension, ignoring
  // letter case. False when `extension` is empty or the name's extension has more than 19 bytes.
  bool HasExtension(std::string const& extension) const;

  // Renames the reference so that its name has the extension, given with or without a leading ".".
  // An empty one removes the extension and its ".", or adds a "." where there is none. The new URL
  // is that of a file. A reference without a name stays as it is.
  void ReplaceExtensionBy(std::string const& extension);

  // --- Editing --------------------------------------------------------------------------------
  //
  // Returns true when the reference names the new item. A null argument, or one that cannot be
  // joined, leaves a reference that holds a URL as it was; a URL that cannot be made leaves it
  // empty. `char const*` is UTF-8.

  // Appends a component, or several with "/" between them, as it stands. An empty reference takes
  // the component as its path, with "~" expanded. REQUIRES: not null when a URL is held.
  bool AddToPath(CFStringRef component, bool isDirectory);

  // Appends the other's last component, as a folder if it is one. An empty reference is refused.
  bool AddToPath(CFileRef const& other);
  bool AddToPath(char const* component, bool isDirectory);

  // Replaces the last component by a name. An empty reference takes the name as its path, with "~"
  // expanded, unless `isDirectory` is set: then it is refused.
  bool ReplaceName(CFStringRef name, bool isDirectory);
  bool ReplaceName(CFileRef const& other);
  bool ReplaceName(char const* name, bool isDirectory);

  // Makes the reference name the containing folder; that of "/" is "/". Without an absolute path,
  // it becomes empty.
  void SetToParent();

  // Makes the reference name the target of an alias or a symbolic link, one link at a time. Returns
  // false, with the reference as it was, when the item is neither. A relative link text becomes a
  // relative path as it stands.
  bool ResolveAlias(bool allowInteraction);

  // --- Volume and folder ----------------------------------------------------------------------
  //
  // Ids are 32 bits wide. Signed results are ids as an FSSpec holds them, so an id from 0x80000000
  // on is negative; GetNodeID() returns the same id unsigned. Of an id argument, the lower 32 bits
  // count, so both forms are accepted.

  // The volume that holds the item. For an item that does not exist, that of the nearest volume
  // root above its path. kNoVolume on failure.
  short GetVolumeRefNumber() const;

  // The id of the folder that holds the item, or would hold it; kNoFolder when that is not a folder
  // on disk.
  long GetParentID() const;

  // The item's own id when it is a folder; otherwise GetParentID().
  long GetDirectoryID() const;

  // The id of an existing item; kNoNode on failure.
  unsigned long GetNodeID() const;

  // Whether the item is the top folder of a file system: its parent is on another device, or is the
  // item itself.
  bool IsRoot() const;

  // Writes the name as UTF-16. For an existing item, it is the catalog's name, in which ':' and '/'
  // are exchanged; for any other, the last component as it stands. Returns false, with the record
  // as it was, for an empty reference and for a component of more than 255 units.
  bool UnicodeFileName(HFSUniStr255* name) const;

  // --- FSSpec ---------------------------------------------------------------------------------
  //
  // The empty FSSpec has kNoVolume, kNoFolder and a name of length 0. In a record passed as an
  // argument, a name length above 63 counts as 63. `last` has no effect.

  // The record of an existing item is the File Manager's. Any other item gets its name, cut to 63
  // bytes, and the volume and id of whatever is in the place of its folder, be it a folder, a file
  // or a link (the empty values when nothing is). Returns false, with the record untouched, for an
  // empty reference; also returns false for an item that the catalog refuses and for a path without
  // a last component. A URL that is not a file's, or is another machine's, counts as an item that
  // does not exist.
  bool GetFSSpec(FSSpec* spec) const;

  // The cached FSSpec, filled in anew by GetFSSpec(), whatever that returns; valid like GetPath().
  operator FSSpec const&() const;  // NOLINT(google-explicit-constructor)
  operator FSSpec const*() const;  // NOLINT(google-explicit-constructor)

  // The existing item with a name of `nameLength` UTF-16 units in the folder `dirID`; with length
  // 0, the folder itself. An item that cannot be found leaves the reference as it was; with length
  // 0, an id that is not a folder's leaves it empty.
  CFileRef(short vRefNum, long dirID, unsigned long nameLength, unsigned short const* name,
           bool last);
  bool Set(short vRefNum, long dirID, unsigned long nameLength, unsigned short const* name,
           bool last);

  // An HFS path that begins with its volume's name, in mLocalEncoding or the system's encoding.
  // Fails for null.
  bool SetFromHFSPath(char const* hfsPath, bool isFolder);

  // Sets the reference as CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC does; null gives an
  // empty reference. Only the form for a non-const record resolves an alias.
  CFileRef(FSSpec const* spec, bool searchOtherVolumes, bool last);
  CFileRef(FSSpec const& spec, bool searchOtherVolumes, bool last);
  CFileRef(FSSpec* spec, bool searchOtherVolumes, bool last);
  bool SetFromFSSpec(FSSpec const* spec, bool searchOtherVolumes, bool last);

 private:
  bool Hold(CFURLRef url);  // takes over the URL, into an empty reference; false for null
  bool HoldPathOf(CFURLRef url, bool isDirectory);
  bool FollowLink();
  std::optional<bool> ReadIsRoot() const;  // nullopt when it cannot be examined
  bool IsOfNoFile() const;  // whether there is an item at the path that this URL does not name
  bool ClimbToExisting();   // stays at an existing folder; false, and empty, when nothing exists

  CFURLRef mURL;           // one reference that we own; null when empty
  UInt32 mValid;           // 1 exactly when mURL is not null; the lowest bit counts
  mutable char* mPath;     // allocated with new[] on first use; null before
  mutable FSRef mFSRef;    // rewritten on each use; all zero when there is no such item
  mutable FSSpec mFSSpec;  // rewritten on each use
};

// The URL of a POSIX path, owned by the caller. A leading "~" is the home folder of the current
// user, "~name" that of the named user; with nothing, or only a "/", after it, the URL is a
// folder's whatever `isDirectory` says. Null for an unknown user, an empty path, or any path
// without a URL. Aborts for a null path.
CFURLRef CreateURLByExpandingTildePath(CFStringRef path, bool isDirectory);
