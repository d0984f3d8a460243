// tallowmere-cli: the service's requests for people and scripts.

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <chrono>
#include <exception>
#include <functional>
#include <iostream>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "cli/Aliases.h"
#include "cli/Commands.h"
#include "cli/Output.h"

namespace {

using namespace tallowmere::cli;

// Without privilege, a request can take a pass over a whole volume.
constexpr double kSecondsForARequest = 600;

const std::string kHelpTells = "--help tells more";

// The parsed arguments.
struct Arguments {
  double seconds = kSecondsForARequest;
  ItemsToAsk items;
  std::string folder;
  std::string output;
  Sound sound;
  bool asHex = false;
  bool searchOtherVolumes = false;
};

std::optional<double> ReadNumber(const std::string& text) {
  double number = 0;
  const char* const end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, number);
  if (error != std::errc() || stop != end) return std::nullopt;
  return number;
}

// Checks of numbers: return what is wrong, or an empty text.
std::string CheckTime(const std::string& text) {
  const auto seconds = ReadNumber(text);
  return seconds && *seconds > 0 ? "" : text + " is no time above 0";
}

std::string CheckRate(const std::string& text) {
  const auto hertz = ReadNumber(text);
  return hertz && IsRate(*hertz) ? "" : text + " is no rate below 65536 hertz";
}

bool HasInputAmongOthers(const std::vector<std::string>& items) {
  return items.size() > 1 && std::find(items.begin(), items.end(), "-") != items.end();
}

class CommandLine {
 public:
  CommandLine() {
    mApp.require_subcommand(1);
    mApp.set_version_flag("--version", TALLOWMERE_VERSION);
    mApp.add_option("--service", mArguments.items.client.service,
                    "The service's program; without it, the one beside this program or on PATH")
        ->type_name("PATH");
    mApp.add_option("--deadline", mArguments.seconds, "How long one request may take, in seconds")
        ->check(CheckTime)
        ->capture_default_str();
    AddConversions();
    AddTheOthers();
  }

  int Run(int count, char** arguments) {
    try {
      mApp.parse(count, arguments);
    } catch (const CLI::ParseError& error) {
      if (error.get_exit_code() == 0) return mApp.exit(error);
      Complain(std::string(error.what()) + "; " + kHelpTells);
      return kWrongUsage;
    }
    if (HasInputAmongOthers(mArguments.items.items)) {
      Complain("\"-\" stands for standard input and takes no other items beside it; " + kHelpTells);
      return kWrongUsage;
    }
    const std::chrono::duration<double> deadline(mArguments.seconds);
    ClientOptions& client = mArguments.items.client;
    client.deadline = deadline < std::chrono::milliseconds::max()
                          ? std::chrono::ceil<std::chrono::milliseconds>(deadline)
                          : std::chrono::milliseconds::max();
    return mRun();
  }

 private:
  using ClientOptions = tallowmere::ClientOptions;

  CLI::App* Add(const std::string& name, const std::string& what, const std::string& examples,
                std::function<int()> run) {
    CLI::App* const command = mApp.add_subcommand(name, what);
    command->footer("Examples:\n" + examples);
    command->callback([this, run = std::move(run)] { mRun = run; });
    return command;
  }

  CLI::App* AddForItems(const std::string& name, const std::string& what,
                        const std::string& examples, std::function<int()> run) {
    CLI::App* const command = Add(name, what, examples, std::move(run));
    AddJson(command);
    command->add_flag("-0,--null", mArguments.items.format.isNullTerminated,
                      "Items of standard input and results end with a NUL, not a newline");
    return command;
  }

  void AddJson(CLI::App* command) {
    command->add_flag("--json", mArguments.items.format.isJson, "One JSON object a line");
  }

  void AddItems(CLI::App* command, const std::string& name, const std::string& what) {
    command->add_option(name, mArguments.items.items, what + "; \"-\" for lines of standard input")
        ->required()
        ->type_name("");
  }

  void AddConversions();
  void AddTheOthers();

  CLI::App mApp{"Asks the tallowmere service about files and volumes.", "tallowmere-cli"};
  Arguments mArguments;
  std::function<int()> mRun;
};

void CommandLine::AddConversions() {
  Arguments& a = mArguments;
  CLI::App* command = AddForItems("spec", "Print the record of each path, as volume:parent:name",
                                  "  tallowmere-cli spec /etc/hostname\n"
                                  "  find . -print0 | tallowmere-cli spec -0 --json -",
                                  [&a] { return PrintRecords(a.items, a.asHex); });
  AddItems(command, "path", "Files or folders, also new ones in an existing folder");
  command->add_flag("--hex", a.asHex, "The 70 bytes of the record in hexadecimal");

  command = AddForItems("path", "Print the path of each record",
                        "  tallowmere-cli path -27:19:hostname\n"
                        "  tallowmere-cli spec --hex - <paths | tallowmere-cli path -",
                        [&a] { return PrintPathsOfRecords(a.items, a.searchOtherVolumes); });
  AddItems(command, "record", "volume:parent:name, or 140 hexadecimal digits");
  command->add_flag("--other-volumes", a.searchOtherVolumes,
                    "Look on the other volumes for what is not there");

  command = AddForItems("hfs", "Print the full HFS path of each path",
                        "  tallowmere-cli hfs /usr/bin/env /usr/bin",
                        [&a] { return PrintHFSPaths(a.items); });
  AddItems(command, "path", "Files or folders");

  command = AddForItems("posix", "Print the path of each HFS path",
                        "  tallowmere-cli posix Root:usr:bin:env\n"
                        "  tallowmere-cli hfs - <paths | tallowmere-cli posix -",
                        [&a] { return PrintPathsOfHFSPaths(a.items); });
  AddItems(command, "hfspath", "HFS paths, in UTF-8");

  command =
      AddForItems("name", "Print the HFS name of each path",
                  "  tallowmere-cli name 'a file: new.txt'", [&a] { return PrintNames(a.items); });
  AddItems(command, "path", "Files or folders");

  command = AddForItems("append", "Print the path of each HFS name in a folder",
                        "  tallowmere-cli append /tmp 'Mix 1/2.aif'",
                        [&a] { return PrintPathsOfNames(a.items, a.folder); });
  command->add_option("folder", a.folder, "The folder")->required()->type_name("");
  AddItems(command, "name", "HFS names, in UTF-8, also new ones");

  command = AddForItems(
      "identify", "Print record, full HFS path and the way back of each path, as a table",
      "  tallowmere-cli identify / /usr/bin/env", [&a] { return PrintIdentities(a.items); });
  AddItems(command, "path", "Files or folders, also new ones in an existing folder");
}

void CommandLine::AddTheOthers() {
  Arguments& a = mArguments;
  AddJson(Add("volumes", "Print number, name and mount point of every volume",
              "  tallowmere-cli volumes",
              [&a] { return PrintVolumes(a.items.client, a.items.format.isJson); }));

  CLI::App* command =
      Add("aiff", "Print the settings that export a sound to AIFF files",
          "  tallowmere-cli aiff --format twos --rate 44100 --bits 16 --channels 2\n"
          "  tallowmere-cli aiff --format sowt --output settings.bin",
          [&a] {
            return PrintExportSettings(a.items.client, a.sound, a.items.format.isJson, a.output);
          });
  AddJson(command);
  command->add_option("--rate", a.sound.hertz, "In hertz")->check(CheckRate)->capture_default_str();
  command->add_option("--bits", a.sound.bits, "In a sample")->capture_default_str();
  command->add_option("--channels", a.sound.channels, "Of the sound")
      ->check(CLI::Range(0, 255))
      ->capture_default_str();
  command->add_option("--format", a.sound.format, "Four-character code")
      ->check([](const std::string& code) {
        return code.size() == 4 ? "" : "a format has four characters, trailing spaces included";
      })
      ->capture_default_str();
  command
      ->add_option("--output", a.output, "The file for the settings as they are; \"-\" prints them")
      ->type_name("FILE");

  command =
      Add("census", "Check that each item of a folder comes back by its record, in another process",
          "  tallowmere-cli census /home",
          [&a] { return TakeCensus(a.items.client, a.items.format.isJson, a.folder); });
  AddJson(command);
  command->add_option("folder", a.folder, "The folder")->required()->check(CLI::ExistingDirectory);

  command = AddForItems(
      "alias", "Print what each alias file, record or bookmark says, and where it leads now",
      "  tallowmere-cli alias 'Old Disk/Mix alias'\n"
      "  tallowmere-cli alias --hex --json - <records",
      [&a] {
        const Format& format = a.items.format;
        return PrintAliases({a.items.items, a.asHex, format.isJson, format.Separator()});
      });
  AddItems(command, "file", "Alias files, or files with a record or bookmark");
  command->add_flag("--hex", a.asHex, "The items are bytes as hexadecimal digits");

  AddJson(Add("serve-check", "Start the service and try each request",
              "  tallowmere-cli serve-check",
              [&a] { return CheckService(a.items.client, a.items.format.isJson); }));
}

}  // namespace

int main(int count, char** arguments) {
  std::ios::sync_with_stdio(false);
  try {
    return CommandLine().Run(count, arguments);
  } catch (const std::exception& error) {
    return Complain(error.what());
  }
}
