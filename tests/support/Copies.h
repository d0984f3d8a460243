// A program of which copies are made instead of starting it again. The original waits in front of
// the program's own code, after the work of the loader and the C library, which is most of a start.
#pragma once

#include <sys/types.h>

#include <memory>
#include <string>

#include "support/ChildProgram.h"

namespace tallowmere::test {

class Copies {
 public:
  // Starts the original with this process's id as its argument. `library` is loaded into it and
  // calls BecomeCopies.
  Copies(const std::string& program, const std::string& library);
  Copies(const Copies&) = delete;
  Copies& operator=(const Copies&) = delete;
  ~Copies();

  // Whether the library can work here.
  bool CanMake() const { return mCanMake; }

  // Makes a copy with these streams, a child of this process. Returns its id, or -1.
  pid_t Make(const ChildProgram::Streams& streams) const;

  // Waits for the descriptor that the library sends from each copy; -1 when it has none.
  int Descriptor() const;

 private:
  int mSocket = -1;
  std::unique_ptr<ChildProgram> mOriginal;
  bool mCanMake = false;
};

}  // namespace tallowmere::test
