// The one query of the desktop's workspace service that is supported.
#pragma once

#include <CoreFoundation/CoreFoundation.h>

namespace Workspace {

// Whether the item at a POSIX path is a package: a folder that the user sees as one document. Its
// extension is a registered document or bundle type, whatever its letter case, or it holds a file
// Contents/Info.plist or Contents/PkgInfo. Links are not followed, so a link to a package is not
// one; a "/" at the path's end is ignored. A relative path starts at the current directory. False
// for null, for what does not exist and when there is not enough memory.
bool IsFilePackageAtPath(CFStringRef path);

}  // namespace Workspace
