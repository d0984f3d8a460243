// Reads what is in a file, its attributes and links: never changed by it, times of access included
// where the kernel allows that.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "kernel/Descriptor.h"
#include "kernel/Item.h"
#include "kernel/Result.h"

namespace tallowmere::kernel {

// Opens the file of a spot for reading. ENOENT when there is something else than a regular file;
// EWOULDBLOCK when another process has a lease on it and keeps it for more than a second.
Result<Descriptor> OpenFile(const Spot& spot);

// The same for a file that was seen there. ENOENT when it is another one by now.
Result<Descriptor> OpenFile(const Spot& spot, const Item& seen);

// The size in bytes.
Result<std::uint64_t> SizeOf(const Descriptor& file);

// The bytes from an offset on, at most so many: fewer where the file ends.
Result<std::string> ReadBytes(const Descriptor& file, std::uint64_t offset, std::size_t most);

// The whole attribute with a name: getxattr(2). ENODATA where there is none, E2BIG where it is
// longer than attributes can be; EOPNOTSUPP and others where the file system knows no such names.
Result<std::string> ReadAttribute(const Descriptor& file, const char* name);

// The text of a symbolic link: readlinkat(2).
Result<std::string> ReadLink(const Spot& spot);

}  // namespace tallowmere::kernel
