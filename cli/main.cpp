// tallowmere-cli: the service's requests for people and scripts.

#include <CLI/CLI.hpp>
#include <exception>
#include <iostream>
#include <string>

#include "cli/Commands.h"

namespace {

constexpr int kFailed = 1;
constexpr int kWrongUsage = 2;

int Run(int argumentCount, char** arguments) {
  CLI::App app("Asks the tallowmere service about files and volumes.", "tallowmere-cli");
  app.require_subcommand(1);

  tallowmere::ClientOptions options;
  app.add_option("--service", options.service, "The service's program")->type_name("PATH");
  const CLI::App* const volumes =
      app.add_subcommand("volumes", "Print number, name and mount point of every volume");
  std::string folder;
  CLI::App* const census = app.add_subcommand(
      "census", "Check that each item of a folder comes back by its record, in another process");
  census->add_option("folder", folder, "The folder")->required()->check(CLI::ExistingDirectory);

  try {
    app.parse(argumentCount, arguments);
  } catch (const CLI::ParseError& error) {
    return app.exit(error) == 0 ? 0 : kWrongUsage;
  }
  if (volumes->parsed()) return tallowmere::cli::PrintVolumes(options);
  if (census->parsed()) return tallowmere::cli::TakeCensus(options, folder);
  return kWrongUsage;
}

}  // namespace

int main(int argumentCount, char** arguments) {
  try {
    return Run(argumentCount, arguments);
  } catch (const std::exception& error) {
    std::cerr << "tallowmere-cli: " << error.what() << '\n';
    return kFailed;
  }
}
