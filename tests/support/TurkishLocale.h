// Sets a Turkish locale, in which "I" and "i" are not the same letter in two cases.
#pragma once

#include <cctype>
#include <clocale>
#include <cstdlib>

#include "support/FileSystemImage.h"
#include "support/TemporaryFolder.h"

namespace tallowmere::test {

// Sets Turkish for the rest of the program, built from the sources of the C library's locales.
class TurkishLocale {
 public:
  TurkishLocale() {
    const std::string compiled = (mFolder.Path() / kName).string();
    if (!RunTool({"localedef", "-i", "tr_TR", "-f", "ISO-8859-9", compiled})) return;
    setenv("LOCPATH", mFolder.Path().c_str(), 1);
    mIsChosen = std::setlocale(LC_ALL, kName) != nullptr && std::tolower('I') != 'i';
    unsetenv("LOCPATH");
  }
  TurkishLocale(const TurkishLocale&) = delete;
  TurkishLocale& operator=(const TurkishLocale&) = delete;
  ~TurkishLocale() { std::setlocale(LC_ALL, "C"); }

  // False where those sources are not installed.
  bool IsChosen() const { return mIsChosen; }

 private:
  static constexpr const char* kName = "tr_TR.ISO-8859-9";

  TemporaryFolder mFolder;
  bool mIsChosen = false;
};

}  // namespace tallowmere::test
