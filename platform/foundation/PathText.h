// Components, extension and folder mark of a path with "/" between its components.
//
// A path is as Linux spells it or percent-encoded as in a URL, but for HasFolderMark and
// ParentPath, for which "%2E" is ".", and FolderOf, for which it is a name.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// The path with one "/" more at its end if it has none (folder), or with none unless it is "/"
// itself. REQUIRES: the path is not empty.
std::string WithFolderMark(std::string_view path, bool folder);

// The path without "/" at its end, except for "/" itself.
std::string_view WithoutFolderMark(std::string_view path);

// The last component without the folder mark: "/a/b/" → "b", "/" → "/". None for an empty path.
std::optional<std::string_view> LastComponent(std::string_view path);

// Whether the path of a URL ends in "/" or its last component is "." or "..".
bool HasFolderMark(std::string_view path);

// The containing folder of a URL's path, with the folder mark: "/a/b/" → "/a/", "/" → "/",
// "a" → "./", "a/.." → "a/../../". REQUIRES: the path is not empty.
std::string ParentPath(std::string_view path);

// The path of the folder that holds an item of Linux, without the folder mark: "/a/b" → "/a",
// "/a" → "/". REQUIRES: the path is absolute and not "/", without a folder mark.
std::string FolderOf(std::string_view path);

// The path and a component with a "/" between them, unless the path is empty or ends in one.
std::string JoinPath(std::string_view path, std::string_view component);

// Whether a path is a folder's or below it, by their spelling. REQUIRES: both are absolute, without
// a folder mark.
bool IsWithin(std::string_view path, std::string_view folder);

// What follows the last "." of a component. None when there is none, when it is empty and when the
// only "." is the first character.
std::optional<std::string_view> Extension(std::string_view component);

}  // namespace tallowmere::foundation
