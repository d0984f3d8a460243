// Generators of random names and paths that Linux permits.
#pragma once

#include <rapidcheck.h>

#include <string>
#include <vector>

namespace tallowmere::foundation::test {

inline std::string Concatenated(const std::vector<std::string>& pieces) {
  std::string all;
  for (const std::string& piece : pieces) all += piece;
  return all;
}

// A byte but NUL and "/", a character of valid UTF-8, or text with a meaning in URLs or paths.
inline rc::Gen<std::string> AnyNamePiece() {
  return rc::gen::oneOf(
      rc::gen::map(rc::gen::suchThat(rc::gen::inRange(1, 256), [](int c) { return c != '/'; }),
                   [](int c) { return std::string(1, static_cast<char>(c)); }),
      rc::gen::element<std::string>("\xC3\xA9", "e\xCC\x81", "\xE6\x97\xA5", "\xF0\x9F\x98\x80",
                                    "\xED\xB2\x80", ".", "..", ":", "%2F", "%", "?", "#", "\\",
                                    "C:", "~", " "));
}

// A name, possibly empty.
inline rc::Gen<std::string> AnyName() {
  return rc::gen::map(rc::gen::container<std::vector<std::string>>(AnyNamePiece()), Concatenated);
}

// Names with "/" between, before and after them, also doubled. Possibly empty.
inline rc::Gen<std::string> AnyPath() {
  return rc::gen::map(rc::gen::container<std::vector<std::string>>(
                          rc::gen::oneOf(AnyNamePiece(), rc::gen::just(std::string("/")))),
                      Concatenated);
}

}  // namespace tallowmere::foundation::test
