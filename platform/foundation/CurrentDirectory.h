// The directory to which relative paths and URLs are relative. It is declared here, where it is
// needed, and defined by the room that makes system calls.
#pragma once

#include <optional>
#include <string>

namespace tallowmere::foundation {

// The current directory, an absolute path in Linux bytes. Nullopt when it has been removed or
// cannot be read. May throw std::bad_alloc.
std::optional<std::string> CurrentDirectory();

}  // namespace tallowmere::foundation
