// The same without the service, by linking the library.
#include <CFileRef.h>
#include <LegacyHFSBridge.h>

#include <iostream>

int main(int argumentCount, char** arguments) {
  if (argumentCount != 2) return 2;
  const CFileRef file(arguments[1], false);
  FSSpec spec;
  if (!CFileUtilGetDeprecatedFSSpecThroughIPC(file, &spec)) return 1;
  std::cout << spec.vRefNum << ':' << spec.parID << ':';
  std::cout.write(reinterpret_cast<const char*>(spec.name + 1), spec.name[0]) << '\n';
  CFileRef back;
  CFileUtilSetFileRefFromDeprecatedFSSpecThroughIPC(&back, &spec, false, false);
  std::cout << std::string(back) << '\n';
}
