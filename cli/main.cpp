// tallowmere-cli: the service's requests for people and scripts.

#include <CLI/CLI.hpp>
#include <algorithm>
#include <bit>
#include <charconv>
#include <chrono>
#include <cstdint>
#include <exception>
#include <filesystem>
#include <functional>
#include <iostream>
#include <map>
#include <optional>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include "cli/Aliases.h"
#include "cli/Commands.h"
#include "cli/Nearest.h"
#include "cli/Output.h"

namespace {

using namespace tallowmere::cli;

// Without privilege, one request may walk a whole volume.
constexpr double kSecondsForARequest = 600;

const std::string kHelpTells = "--help tells more";

// The parsed arguments.
struct Arguments {
  double seconds = kSecondsForARequest;
  ItemsToAsk items;
  std::string folder;
  std::string output;
  std::string topic;
  Sound sound;
  bool asHex = false;
  bool targetsOnly = false;
  RecordOptions records;
};

std::optional<double> ReadNumber(const std::string& text) {
  double number = 0;
  const char* const end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, number);
  if (error != std::errc() || stop != end) return std::nullopt;
  return number;
}

// Reads a number as the parser does, but without a sign.
std::optional<std::size_t> ReadCount(const std::string& text) {
  std::size_t count = 0;
  const bool isCount =
      text.find_first_of("+-") == std::string::npos && CLI::detail::lexical_cast(text, count);
  return isCount ? std::optional(count) : std::nullopt;
}

// Checks of values: return what is wrong, or an empty text.
std::string CheckTime(const std::string& text) {
  const auto seconds = ReadNumber(text);
  return seconds && *seconds > 0 ? "" : text + " is no time above 0";
}

std::string CheckRate(const std::string& text) {
  const auto hertz = ReadNumber(text);
  return hertz && IsRate(*hertz) ? "" : text + " is no rate below 65536 hertz";
}

std::string CheckPlace(const std::string& text) {
  return text.empty() ? "an empty text is no place" : "";
}

std::string CheckBits(const std::string& text) {
  const auto bits = ReadCount(text);
  return bits && *bits <= UINT16_MAX ? "" : text + " is no number of bits below 65536";
}

std::string CheckChannels(const std::string& text) {
  const auto channels = ReadCount(text);
  return channels && *channels <= UINT8_MAX ? "" : text + " is no number of channels below 256";
}

std::string CheckFolder(const std::string& text) {
  std::error_code error;
  if (std::filesystem::is_directory(text, error)) return "";
  const bool isHidden = error == std::errc::permission_denied;
  return isHidden ? '"' + text + "\" cannot be looked at: " + error.message()
                  : "there is no folder \"" + text + '"';
}

std::string CheckMap(const std::string& text) {
  return ReadPlace(text) ? "" : '"' + text + "\" is no OLD-NAME=FOLDER";
}

std::string CheckCount(const std::string& text) {
  return ReadCount(text) ? "" : text + " is no number of bytes";
}

std::string CheckStride(const std::string& text) {
  const auto bytes = ReadCount(text);
  if (bytes && *bytes < 70) return text + " is less than the 70 bytes of a record";
  return CheckCount(text);
}

bool IsOption(const std::string& word) {
  return word.size() > 1 && word[0] == '-';
}

bool HasInputAmongOthers(const std::vector<std::string>& items) {
  return items.size() > 1 && std::find(items.begin(), items.end(), "-") != items.end();
}

class CommandLine {
 public:
  CommandLine() {
    mApp.require_subcommand(1);
    mApp.set_version_flag("-V,--version", TALLOWMERE_VERSION);
    mApp.add_option("--service", mArguments.items.client.service,
                    "The service's program; without it, the one beside this program or on PATH")
        ->type_name("PATH");
    mApp.add_option("--deadline", mArguments.seconds, "How long one request may take, in seconds")
        ->check(CheckTime)
        ->capture_default_str();
    AddRecords();
    AddHFSPaths();
    AddNames();
    AddVolumes();
    AddAudio();
    AddCensusAndAliases();
    AddCheck();
  }

  int Run(int count, char** arguments) {
    try {
      mApp.parse(count, arguments);
    } catch (const CLI::ParseError& error) {
      if (error.get_exit_code() == 0) return FinishOutput(mApp.exit(error));
      return Refuse(WhatIsUnknown().value_or(error.what()));
    }
    if (HasInputAmongOthers(mArguments.items.items)) {
      return Refuse("\"-\" stands for standard input and takes no other items beside it");
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

  static int Refuse(const std::string& reason) {
    Complain(reason + "; " + kHelpTells);
    return kWrongUsage;
  }

  // Names the first argument that no command takes, whatever else is wrong.
  std::optional<std::string> WhatIsUnknown() const {
    const std::vector<std::string> words = mApp.remaining(true);
    const auto end = std::find(words.begin(), words.end(), "--");
    if (end == words.begin()) return std::nullopt;
    const auto commands = mApp.get_subcommands();
    if (commands.empty() && !IsOption(words[0])) return NoCommand(words[0]);
    const auto option = std::find_if(words.begin(), end, IsOption);
    if (option != end) return "there is no option " + *option;
    return '"' + commands[0]->get_name() + "\" takes no \"" + words[0] + '"';
  }

  std::string NoCommand(const std::string& word) const {
    std::vector<std::string> names;
    for (const CLI::App* const command : mApp.get_subcommands({})) {
      names.push_back(command->get_name());
    }
    const std::string nearest = Nearest(word, names);
    return "there is no command \"" + word + '"' +
           (nearest.empty() ? "" : "; the nearest is \"" + nearest + '"');
  }

  // Prints the help of the program, or of a command.
  int PrintHelp() const {
    const std::string& name = mArguments.topic;
    const auto commands = mApp.get_subcommands(
        [&name](const CLI::App* command) { return command->get_name() == name; });
    if (!name.empty() && commands.empty()) return Refuse(NoCommand(name));
    const CLI::App* const command = name.empty() ? &mApp : commands[0];
    const std::string ofWhat = name.empty() ? mApp.get_name() : mApp.get_name() + ' ' + name;
    std::cout << mApp.get_formatter()->make_help(command, ofWhat, CLI::AppFormatMode::Normal);
    return FinishOutput();
  }

  CLI::App* Add(const std::string& name, const std::string& what, const std::string& examples,
                std::function<int()> run) {
    CLI::App* const command = mApp.add_subcommand(name, what);
    command->footer("Examples:\n" + examples);
    command->callback([this, run = std::move(run)] { mRun = run; });
    return command;
  }

  // A command that answers each item, in any form.
  CLI::App* AddForItems(const std::string& name, const std::string& what,
                        const std::string& examples, std::function<int()> run) {
    CLI::App* const command = Add(name, what, examples, std::move(run));
    AddJson(command);
    AddNullInput(command);
    command->add_flag("--existing", mArguments.items.format.isExistingOnly,
                      "Fail for what does not exist");
    return command;
  }

  // A command that answers each item with a line.
  CLI::App* AddConversion(const std::string& name, const std::string& what,
                          const std::string& examples, std::function<int()> run) {
    CLI::App* const command = AddForItems(name, what, examples, std::move(run));
    AddNullOutput(command);
    AddQuiet(command, "Neither a progress bar nor a summary");
    AddNoProgress(command);
    return command;
  }

  void AddNullInput(CLI::App* command) {
    command->add_flag("-0,--null", mArguments.items.format.hasNullInput,
                      "Items of standard input end with a NUL, not a newline");
  }

  CLI::Option* AddNullOutput(CLI::App* command) {
    return command->add_flag("--null-output", mArguments.items.format.hasNullOutput,
                             "Results end with a NUL, not a newline; JSON is lines all the same");
  }

  void AddQuiet(CLI::App* command, const std::string& what) {
    command->add_flag("-q,--quiet", mArguments.items.format.isQuiet, what);
  }

  void AddNoProgress(CLI::App* command) {
    command->add_flag("--no-progress", mArguments.items.format.hasNoProgress, "No progress bar");
  }

  void AddJson(CLI::App* command) {
    command->add_flag("--json", mArguments.items.format.isJson, "One JSON object a line");
  }

  void AddItems(CLI::App* command, const std::string& name, const std::string& what) {
    command->add_option(name, mArguments.items.items, what + "; \"-\" for lines of standard input")
        ->required()
        ->type_name("");
  }

  void AddTable(CLI::App* command) {
    command
        ->add_option("--volumes", mArguments.records.places.table,
                     "Lines OLD-NUMBER-OR-NAME=PLACE tell where volumes are; '#' begins a comment")
        ->check(CheckPlace)
        ->type_name("FILE");
  }

  void AddMaps(CLI::App* command) {
    command
        ->add_option("--map", mArguments.records.places.maps,
                     "The volume that was called so has been copied into a folder")
        ->check(CheckMap)
        ->type_name("OLD-NAME=FOLDER")
        ->allow_extra_args(false);
    AddTable(command);
  }

  void AddRecordOptions(CLI::App* command);
  void AddRecords();
  void AddHFSPaths();
  void AddNames();
  void AddVolumes();
  void AddAudio();
  void AddCensusAndAliases();
  void AddCheck();

  CLI::App mApp{"Asks the tallowmere service about files and volumes.", "tallowmere-cli"};
  Arguments mArguments;
  std::function<int()> mRun;
};

void CommandLine::AddRecordOptions(CLI::App* command) {
  RecordOptions& records = mArguments.records;
  CLI::Option* const volume =
      command
          ->add_option("--volume", records.places.volume,
                       "All records are of this volume, whatever number they have: its mount point "
                       "or name")
          ->check(CheckPlace)
          ->type_name("PLACE");
  AddTable(command);
  command->get_option("--volumes")->excludes(volume);
  command
      ->add_option_function<std::string>(
          "--byte-order",
          [&records](const std::string& order) {
            records.form.order = order == "big" ? std::endian::big : std::endian::little;
          },
          "Of the numbers in bytes: big, as older machines stored them, or little")
      ->check([](const std::string& order) {
        return order == "big" || order == "little" ? "" : '"' + order + "\" is no byte order";
      })
      ->type_name("ORDER");
  CLI::Option* const packed = command->add_flag("--packed", records.form.isPacked,
                                                "Items are files of records, 70 bytes each");
  packed->excludes(command->get_option("--null"));
  command->add_option("--skip", records.form.skip, "Bytes in front of a file's first record")
      ->needs(packed)
      ->check(CheckCount);
  command
      ->add_option("--stride", records.form.stride,
                   "Bytes from the beginning of one record to that of the next")
      ->needs(packed)
      ->check(CheckStride)
      ->capture_default_str();
  command
      ->add_flag("--other-volumes", records.searchOtherVolumes,
                 "Look on the other volumes for what is not there. An item that is found so can be "
                 "another one, with the same name in a folder that has the same id by chance")
      ->excludes(volume);
}

void CommandLine::AddRecords() {
  Arguments& a = mArguments;
  CLI::App* command = AddConversion("spec", "Print the record of each path, as volume:parent:name",
                                    "  tallowmere-cli spec /etc/hostname\n"
                                    "  find . -print0 | tallowmere-cli spec -0 --json -",
                                    [&a] { return PrintRecords(a.items, a.asHex); });
  AddItems(command, "path", "Files or folders, also new ones in an existing folder");
  command->add_flag("--hex", a.asHex, "The 70 bytes of the record in hexadecimal");

  command =
      AddConversion("path", "Print the path of each record",
                    "  tallowmere-cli path -27:19:hostname\n"
                    "  tallowmere-cli spec --hex - <paths | tallowmere-cli path -\n"
                    "  tallowmere-cli path --volume '/mnt/Old Disk' --byte-order big --packed "
                    "records.bin",
                    [&a] { return PrintPathsOfRecords(a.items, a.records); });
  AddItems(command, "record",
           "volume:parent:name, or the 70 bytes in hexadecimal or base64; with --packed, files");
  AddRecordOptions(command);
}

void CommandLine::AddHFSPaths() {
  Arguments& a = mArguments;
  CLI::App* command = AddConversion("hfs", "Print the full HFS path of each path",
                                    "  tallowmere-cli hfs /usr/bin/env /usr/bin",
                                    [&a] { return PrintHFSPaths(a.items); });
  AddItems(command, "path", "Files or folders");

  command = AddConversion("posix", "Print the path of each HFS path",
                          "  tallowmere-cli posix Root:usr:bin:env\n"
                          "  tallowmere-cli hfs - <paths | tallowmere-cli posix -\n"
                          "  tallowmere-cli posix --map 'Old Disk=/srv/copies/old' 'Old Disk:Mix'",
                          [&a] { return PrintPathsOfHFSPaths(a.items, a.records.places); });
  AddItems(command, "hfspath", "HFS paths, in UTF-8");
  AddMaps(command);
}

void CommandLine::AddNames() {
  Arguments& a = mArguments;
  CLI::App* command = AddConversion("name", "Print the HFS name of each path",
                                    "  tallowmere-cli name 'a file: new.txt'",
                                    [&a] { return PrintNames(a.items); });
  AddItems(command, "path", "Files or folders");

  command = AddConversion("append", "Print the path of each HFS name in a folder",
                          "  tallowmere-cli append /tmp 'Mix 1/2.aif'",
                          [&a] { return PrintPathsOfNames(a.items, a.folder); });
  command->add_option("folder", a.folder, "The folder")->required()->type_name("");
  AddItems(command, "name", "HFS names, in UTF-8, also new ones");

  command = AddForItems(
      "identify", "Print record, full HFS path and the way back of each path, as a table",
      "  tallowmere-cli identify / /usr/bin/env", [&a] { return PrintIdentities(a.items); });
  AddQuiet(command, "No summary");
  AddItems(command, "path", "Files or folders, also new ones in an existing folder");
}

void CommandLine::AddVolumes() {
  Arguments& a = mArguments;
  AddJson(Add("volumes", "Print number, name and mount point of every volume",
              "  tallowmere-cli volumes",
              [&a] { return PrintVolumes(a.items.client, a.items.format.isJson); }));
}

void CommandLine::AddAudio() {
  Arguments& a = mArguments;
  CLI::App* const command =
      Add("aiff", "Print the settings that export a sound to AIFF files",
          "  tallowmere-cli aiff --format twos --rate 44100 --bits 16 --channels 2\n"
          "  tallowmere-cli aiff --format sowt --output settings.bin",
          [&a] {
            return PrintExportSettings(a.items.client, a.sound, a.items.format.isJson, a.output);
          });
  AddJson(command);
  command->add_option("--rate", a.sound.hertz, "In hertz")->check(CheckRate)->capture_default_str();
  command->add_option("--bits", a.sound.bits, "In a sample")
      ->check(CheckBits)
      ->capture_default_str();
  command->add_option("--channels", a.sound.channels, "Of the sound")
      ->check(CheckChannels)
      ->capture_default_str();
  command->add_option("--format", a.sound.format, "Four-character code")
      ->check([](const std::string& code) {
        return code.size() == 4 ? "" : "a format has four characters, trailing spaces included";
      })
      ->capture_default_str();
  command
      ->add_option("--output", a.output, "The file for the settings as they are; \"-\" prints them")
      ->type_name("FILE");
}

void CommandLine::AddCensusAndAliases() {
  Arguments& a = mArguments;
  CLI::App* command =
      Add("census", "Check that each item of a folder comes back by its record, in another process",
          "  tallowmere-cli census /home",
          [&a] { return TakeCensus(a.items.client, a.items.format, a.folder); });
  AddJson(command);
  AddQuiet(command, "No progress bar");
  AddNoProgress(command);
  command->add_option("folder", a.folder, "The folder")
      ->required()
      ->check(CheckFolder)
      ->type_name("");

  command =
      Add("alias", "Print what each alias file, record or bookmark says, and where it leads now",
          "  tallowmere-cli alias 'Old Disk/Mix alias'\n"
          "  find . -type f -print0 | tallowmere-cli alias -0 --json -\n"
          "  tallowmere-cli alias --target --map 'Old Disk=/srv/copies/old' 'Mix alias'",
          [&a] {
            return PrintAliases(a.items.items, a.items.format,
                                {a.asHex, a.targetsOnly, a.records.places});
          });
  AddJson(command);
  AddNullInput(command);
  CLI::Option* const target = command->add_flag(
      "--target", a.targetsOnly, "A line for each item: the path of where it leads, and no more");
  AddNullOutput(command)->needs(target);
  AddQuiet(command, "Neither a progress bar nor a summary");
  AddNoProgress(command);
  AddItems(command, "file", "Alias files, or files with a record or bookmark");
  command->add_flag("--hex", a.asHex, "The items are bytes as hexadecimal digits");
  AddMaps(command);
}

void CommandLine::AddCheck() {
  Arguments& a = mArguments;
  AddJson(Add("serve-check", "Start the service and try each request",
              "  tallowmere-cli serve-check",
              [&a] { return CheckService(a.items.client, a.items.format.isJson); }));

  CLI::App* const command = Add("help", "Print help for a command", "  tallowmere-cli help spec",
                                [this] { return PrintHelp(); });
  command->add_option("command", a.topic, "The command; without it, help for all")->type_name("");
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
