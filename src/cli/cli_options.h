// Command line of people and scripts: subcommands, options and their help.
#pragma once

#include <string>
#include <vector>

namespace vlr::cli {

enum class Command { None, Import, Multilook };

// Everything a command line asks for.  Paths are kept as given.
struct Options {
  Command command = Command::None;
  bool help = false;
  bool version = false;
  bool quiet = false;
  std::string product;
  std::string outRoot;  // empty: from the product name, in the current folder
  std::string orbit;
  std::string xca;
  std::string ins;
  std::string auxDir;
  bool groundRange = true;
  bool tiff = false;
  double saturation = 0.0;  // 0: the export's own default
  bool saturationGiven = false;
  // The geocoded copy OUTROOT_geo.tif: its map (an EPSG code; 0 for UTM in
  // the zone of the scene centre) and pixel spacing (0: the ground sampling
  // step).
  bool geocode = false;
  int mapEpsg = 0;
  double mapSpacing = 0.0;
};

// Parses argv[1..] into options; false with a message in error for a
// command line that cannot be run (unknown option, missing value or
// argument, conflicting options).  --help and --version end the parse with
// true at once.
bool ParseCommandLine(int argc, const char* const* argv, Options& options, std::string& error);

// Text of --help: the general one for Command::None.
std::string HelpText(Command command);

// The subcommand names, as the first argument selects them.
bool IsCommandLineWord(const std::string& word);

}  // namespace vlr::cli
