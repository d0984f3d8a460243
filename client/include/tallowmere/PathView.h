// A path that somebody else keeps, in the kernel's bytes: what a function takes that only reads it.
#pragma once

#include <filesystem>
#include <string>
#include <string_view>

namespace tallowmere {

class PathView {
 public:
  // Implicit: a path can be written down in all of these ways. REQUIRES: the text outlives the
  // view.
  PathView(const char* text) : mText(text) {}         // NOLINT(google-explicit-constructor)
  PathView(const std::string& text) : mText(text) {}  // NOLINT(google-explicit-constructor)
  PathView(std::string_view text) : mText(text) {}    // NOLINT(google-explicit-constructor)
  PathView(const std::filesystem::path& path)         // NOLINT(google-explicit-constructor)
      : mText(path.native()) {}

  std::string_view Text() const { return mText; }

 private:
  std::string_view mText;
};

}  // namespace tallowmere
