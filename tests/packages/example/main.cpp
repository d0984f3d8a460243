// A parent process: asks the service for the record of a file, and for the path of that record.
#include <tallowmere/Client.h>

#include <iostream>

int main(int argumentCount, char** arguments) {
  if (argumentCount != 2) return 2;
  tallowmere::Client client;
  const auto spec = client.GetFSSpec(arguments[1]);
  if (!spec || !*spec) {
    std::cerr << (spec ? "there is no record" : spec.Failure().message) << '\n';
    return 1;
  }
  std::cout << (*spec)->vRefNum << ':' << (*spec)->parID << ':' << (*spec)->name << '\n';
  const auto path = client.SetFileRefFromFSSpec(**spec, false);
  if (!path || !*path) {
    std::cerr << (path ? "the record leads nowhere" : path.Failure().message) << '\n';
    return 1;
  }
  std::cout << **path << '\n';
}
