// records SERVICE FOLDER: prints the record of every item in the folder and below it as the service
// gives it, one a line: the id of the holding folder, a space, the HFS name as it is.

#include <tallowmere/Client.h>

#include <cstdint>
#include <filesystem>
#include <iostream>

int main(int argumentCount, char** arguments) {
  if (argumentCount != 3) return 2;
  tallowmere::Client client({.service = arguments[1]});
  for (const auto& item : std::filesystem::recursive_directory_iterator(arguments[2])) {
    const auto record = client.GetFSSpec(item.path().string());
    if (!record || !*record) {
      std::cerr << item.path().string() << " has no record\n";
      return 1;
    }
    std::cout << static_cast<std::uint32_t>((*record)->parID) << ' ' << (*record)->name << '\n';
  }
  return std::cout.flush() ? 0 : 1;
}
