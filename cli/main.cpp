// tallowmere-cli: the service's requests for people and scripts.

#include <CLI/CLI.hpp>
#include <exception>
#include <string>
#include <vector>

#include "cli/Commands.h"
#include "cli/Output.h"

namespace {

using namespace tallowmere::cli;

int Run(int argumentCount, char** arguments) {
  CLI::App app("Asks the tallowmere service about files and volumes.", "tallowmere-cli");
  app.require_subcommand(1);

  tallowmere::ClientOptions options;
  app.add_option("--service", options.service, "The service's program")->type_name("PATH");
  const CLI::App* const volumes =
      app.add_subcommand("volumes", "Print number, name and mount point of every volume");
  std::vector<std::string> paths;
  CLI::App* const identify =
      app.add_subcommand("identify", "Print record, full HFS path and the way back of each path");
  identify->add_option("path", paths, "Files or folders, also new ones")->required();
  Sound sound;
  CLI::App* const aiff =
      app.add_subcommand("aiff", "Print the settings that export a sound to AIFF files");
  aiff->add_option("--rate", sound.hertz, "In hertz")
      ->check(CLI::Range(0.0, 65535.99))
      ->capture_default_str();
  aiff->add_option("--bits", sound.bits, "In a sample")->capture_default_str();
  aiff->add_option("--channels", sound.channels, "Of the sound")
      ->check(CLI::Range(0, 255))
      ->capture_default_str();
  aiff->add_option("--format", sound.format, "Four-character code")
      ->check([](const std::string& code) {
        return code.size() == 4 ? "" : "a format has four characters, trailing spaces included";
      })
      ->capture_default_str();
  std::string folder;
  CLI::App* const census = app.add_subcommand(
      "census", "Check that each item of a folder comes back by its record, in another process");
  census->add_option("folder", folder, "The folder")->required()->check(CLI::ExistingDirectory);

  try {
    app.parse(argumentCount, arguments);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? 0 : kWrongUsage;
  }
  if (volumes->parsed()) return PrintVolumes(options);
  if (identify->parsed()) return PrintIdentities(options, paths);
  if (aiff->parsed()) return PrintExportSettings(options, sound);
  if (census->parsed()) return TakeCensus(options, folder);
  return kWrongUsage;
}

}  // namespace

int main(int argumentCount, char** arguments) {
  try {
    return Run(argumentCount, arguments);
  } catch (const std::exception& error) {
    return Complain(error.what());
  }
}
