#include <AppKit/Workspace.h>

#include <algorithm>
#include <string>
#include <string_view>

#include "foundation/LetterCase.h"
#include "foundation/NoThrow.h"
#include "foundation/PathText.h"
#include "foundation/String.h"
#include "kernel/Item.h"
#include "kernel/Paths.h"
#include "text/FileNameText.h"

namespace {

using namespace tallowmere;
using namespace tallowmere::foundation;

// The extensions of registered document and bundle types that are folders.
constexpr std::string_view kPackageExtensions[] = {
    // programs and their extensions
    "app", "appex", "bundle", "clr", "colorpicker", "component", "docset", "dsym", "ibplugin",
    "kext", "mdimporter", "plugin", "prefpane", "qlgenerator", "saver", "service", "slidesaver",
    "systemextension", "wdgt", "webplugin", "xpc",
    // sound plug-ins
    "aaxplugin", "dpm", "vst", "vst3",
    // installers and archives
    "mpkg", "pkg", "sparsebundle",
    // documents
    "aplibrary", "band", "concert", "dictionary", "download", "fcpbundle", "graffle",
    "imovielibrary", "imovieproject", "key", "logicx", "migratedphotolibrary", "musiclibrary",
    "numbers", "pages", "patch", "photolibrary", "photoslibrary", "playground", "rcproject", "rtfd",
    "scptd", "theater", "tvlibrary", "workflow", "xcassets", "xcdatamodel", "xcdatamodeld",
    "xcodeproj", "xcworkspace"};

// A folder that holds one of these files is a package.
constexpr std::string_view kPackageFiles[] = {"Contents/Info.plist", "Contents/PkgInfo"};

bool IsPackageExtension(std::string_view extension) {
  return std::any_of(
      std::begin(kPackageExtensions), std::end(kPackageExtensions),
      [extension](std::string_view known) { return EqualIgnoringCase(known, extension); });
}

bool IsFolder(const std::string& path) {
  const auto status = kernel::ReadStatus(kernel::AtPath(path.c_str()));
  return status && kernel::IsFolder(status->item);
}

bool IsPackage(const std::string& path) {
  if (!IsFolder(path)) return false;
  const auto extension = Extension(*LastComponent(path));
  if (extension && IsPackageExtension(*extension)) return true;
  return std::any_of(
      std::begin(kPackageFiles), std::end(kPackageFiles),
      [&path](std::string_view file) { return kernel::LeadsToFile(JoinPath(path, file)); });
}

}  // namespace

bool Workspace::IsFilePackageAtPath(CFStringRef path) {
  if (path == nullptr) return false;
  return OrZero([path] {
    const auto bytes = tallowmere::text::FileNameOfText(StringOf(path).Text());
    if (!bytes || bytes->empty() || bytes->find('\0') != bytes->npos) return false;
    return IsPackage(WithFolderMark(*bytes, false));
  });
}
