// Components, extension and folder mark of a path with "/" between its components.
//
// Paths may be as Linux spells them or percent-encoded as in a URL. The exceptions: HasFolderMark
// and ParentPath take "%2E" for "."; FolderOf takes it for a name.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tallowmere::foundation {

// The path with a "/" at its end, one added if it has none (`folder`), or without any unless it is
// "/" itself. REQUIRES: the path is not empty.
std::string WithFolderMark(std::string_view path, bool folder);

// The path without "/" at its end, except for "/" itself.
std::string_view WithoutFolderMark(std::string_view path);

// The last component without the folder mark: "/a/b/" → "b", "/" → "/". Nullopt for an empty path.
std::optional<std::string_view> LastComponent(std::string_view path);

// Whether the path of a URL ends in "/" or its last component is "." or "..".
bool HasFolderMark(std::string_view path);

// The containing folder of a URL's path, with the folder mark: "/a/b/" → "/a/", "/" → "/",
// "a" → "./", "a/.." → "a/../../". REQUIRES: the path is not empty.
std::string ParentPath(std::string_view path);

// The folder that holds the item at a Linux path, without the folder mark: "/a/b" → "/a", "/a" →
// "/". REQUIRES: the path is absolute, is not "/", and has no folder mark.
std::string FolderOf(std::string_view path);

// Joins a path and a component with a "/", unless the path is empty or already ends in one.
std::string JoinPath(std::string_view path, std::string_view component);

// Whether a path is that of the folder or lies below it, judged by spelling alone. REQUIRES: both
// are absolute, without a folder mark.
bool IsWithin(std::string_view path, std::string_view folder);

// What follows the last "." of a component. Nullopt when there is no ".", when nothing follows it,
// and when the only "." is the first character.
std::optional<std::string_view> Extension(std::string_view component);

}  // namespace tallowmere::foundation
