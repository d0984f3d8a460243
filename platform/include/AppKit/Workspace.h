// The one question about documents that the desktop's workspace service answers.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

namespace Workspace {

// Whether the item at a POSIX path is a package: a folder that the user sees as one document. Its
// extension is a registered document or bundle type, whatever its letter case, or it holds a file
// Contents/Info.plist or Contents/PkgInfo. The item itself counts: a link to a package is none, and
// a "/" at the path's end is passed over. A relative path begins at the current directory. False
// for null, for what does not exist and when memory is short.
bool IsFilePackageAtPath(CFStringRef path);

}  // namespace Workspace
