#include "cli/cli_options.h"

#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <functional>

namespace vlr::cli {

namespace {

// One option of a subcommand.  A new option is one more row in the table of
// its subcommand: the parser and the help text both read it from there.
struct OptionRow {
  const char* name;       // "--orbit"
  const char* shortName;  // "-o" or nullptr
  const char* value;      // name of its value in the help, nullptr for a switch
  const char* help;
  // Stores the value (empty for a switch); false with a message in error.
  std::function<bool(Options&, const std::string&, std::string&)> apply;
  // For an option whose value may be left out ("--geocode [EPSG]"): whether
  // the next argument is its value.  The "--name=VALUE" form always is; a
  // left-out value reaches apply as "".
  std::function<bool(const std::string&)> takesNext = nullptr;
};

bool setPath(std::string& field, const std::string& value, const char* what, std::string& error) {
  if (value.empty()) {
    error = std::string(what) + " must not be empty";
    return false;
  }
  field = value;
  return true;
}

const std::vector<OptionRow>& commonOptions() {
  static const std::vector<OptionRow> options = {
      {"--output", "-o", "OUTROOT",
       "output root name; default: the product name without its extension, in the current folder",
       [](Options& o, const std::string& v, std::string& e) {
         return setPath(o.outRoot, v, "the output root", e);
       }},
      {"--aux-dir", nullptr, "DIR",
       "choose ASA_XCA and ASA_INS from the ESA files in DIR valid at the product's sensing start "
       "(by the validity dates in their names; the latest created wins)",
       [](Options& o, const std::string& v, std::string& e) {
         return setPath(o.auxDir, v, "the auxiliary folder", e);
       }},
      {"--quiet", "-q", nullptr,
       "nothing on the terminal but errors: no progress, no notes, no summary",
       [](Options& o, const std::string&, std::string&) {
         o.quiet = true;
         return true;
       }},
  };
  return options;
}

const std::vector<OptionRow>& importOptions() {
  static const std::vector<OptionRow> options = [] {
    std::vector<OptionRow> v;
    v.push_back({"--orbit", nullptr, "FILE",
                 "DORIS orbit file (DOR_VOR or DOR_POR); without it the import has no state "
                 "vectors and no corners",
                 [](Options& o, const std::string& s, std::string& e) {
                   return setPath(o.orbit, s, "the orbit file", e);
                 }});
    v.push_back({"--xca", nullptr, "FILE", "external calibration file (ASA_XCA)",
                 [](Options& o, const std::string& s, std::string& e) {
                   return setPath(o.xca, s, "the calibration file", e);
                 }});
    v.push_back({"--ins", nullptr, "FILE", "instrument characterisation file (ASA_INS)",
                 [](Options& o, const std::string& s, std::string& e) {
                   return setPath(o.ins, s, "the instrument file", e);
                 }});
    v.insert(v.end(), commonOptions().begin(), commonOptions().end());
    return v;
  }();
  return options;
}

const std::vector<OptionRow>& multilookOptions() {
  static const std::vector<OptionRow> options = [] {
    std::vector<OptionRow> v;
    v.push_back({"--orbit", nullptr, "FILE", "DORIS orbit file (DOR_VOR or DOR_POR); required",
                 [](Options& o, const std::string& s, std::string& e) {
                   return setPath(o.orbit, s, "the orbit file", e);
                 }});
    v.push_back({"--ground", nullptr, nullptr, "ground-range output OUTROOT_gr (the default)",
                 [](Options& o, const std::string&, std::string&) {
                   o.groundRange = true;
                   return true;
                 }});
    v.push_back({"--slant", nullptr, nullptr, "slant-range output OUTROOT_pwr",
                 [](Options& o, const std::string&, std::string&) {
                   o.groundRange = false;
                   return true;
                 }});
    v.push_back({"--tiff", nullptr, nullptr, "also write a GeoTIFF copy of the power image",
                 [](Options& o, const std::string&, std::string&) {
                   o.tiff = true;
                   return true;
                 }});
    v.push_back({"--saturation", nullptr, "PCT",
                 "with --tiff: percentage of the brightest pixels shown white, above 0 and at "
                 "most 50 (default 2)",
                 [](Options& o, const std::string& s, std::string& e) {
                   char* end = nullptr;
                   errno = 0;
                   const double pct = std::strtod(s.c_str(), &end);
                   if (s.empty() || *end != '\0' || errno != 0 || !(pct > 0.0 && pct <= 50.0)) {
                     e = "--saturation needs a percentage above 0 and at most 50, not '" + s + "'";
                     return false;
                   }
                   o.saturation = pct;
                   o.saturationGiven = true;
                   return true;
                 }});
    v.push_back({"--geocode", nullptr, "EPSG",
                 "also write OUTROOT_geo.tif, the amplitude geocoded onto a map (Cloud Optimized "
                 "GeoTIFF): UTM in the zone of the scene centre, or the map of the EPSG code",
                 [](Options& o, const std::string& s, std::string& e) {
                   o.geocode = true;
                   if (s.empty()) return true;
                   char* end = nullptr;
                   errno = 0;
                   const long code = std::strtol(s.c_str(), &end, 10);
                   if (*end != '\0' || errno != 0 || code < 1 || code > 999999) {
                     e = "--geocode takes an EPSG code, not '" + s + "'";
                     return false;
                   }
                   o.mapEpsg = static_cast<int>(code);
                   return true;
                 },
                 [](const std::string& next) {
                   return !next.empty() &&
                          next.find_first_not_of("0123456789") == std::string::npos;
                 }});
    v.push_back({"--spacing", nullptr, "SPACING",
                 "with --geocode: map pixel spacing in map units (metres, or degrees on a "
                 "geographic map); default: the ground sampling step",
                 [](Options& o, const std::string& s, std::string& e) {
                   char* end = nullptr;
                   errno = 0;
                   const double v = std::strtod(s.c_str(), &end);
                   if (s.empty() || *end != '\0' || errno != 0 || !(v > 0.0) || !std::isfinite(v)) {
                     e = "--spacing needs a positive number, not '" + s + "'";
                     return false;
                   }
                   o.mapSpacing = v;
                   return true;
                 }});
    v.insert(v.end(), commonOptions().begin(), commonOptions().end());
    return v;
  }();
  return options;
}

const std::vector<OptionRow>& optionsOf(Command c) {
  return c == Command::Import ? importOptions() : multilookOptions();
}

const OptionRow* findOption(Command c, const std::string& name) {
  for (const OptionRow& s : optionsOf(c)) {
    if (name == s.name || (s.shortName != nullptr && name == s.shortName)) return &s;
  }
  return nullptr;
}

// Text broken into lines of at most kHelpWidth characters after indent.
std::string wrapped(const std::string& text, const std::string& indent) {
  constexpr size_t kHelpWidth = 78;
  std::string out, line;
  size_t at = 0;
  while (at < text.size()) {
    size_t end = text.find(' ', at);
    if (end == std::string::npos) end = text.size();
    const std::string word = text.substr(at, end - at);
    if (!line.empty() && indent.size() + line.size() + 1 + word.size() > kHelpWidth) {
      out += indent + line + "\n";
      line.clear();
    }
    line += (line.empty() ? "" : " ") + word;
    at = end + 1;
  }
  if (!line.empty()) out += indent + line + "\n";
  return out;
}

std::string optionHelp(Command c) {
  std::string text;
  for (const OptionRow& s : optionsOf(c)) {
    std::string head = "  ";
    if (s.shortName) head += std::string(s.shortName) + ", ";
    head += s.name;
    if (s.value)
      head += s.takesNext ? std::string(" [") + s.value + "]" : std::string(" ") + s.value;
    text += head + "\n" + wrapped(s.help, "      ");
  }
  text += "  -h, --help\n      this help\n";
  return text;
}

constexpr const char* kCommonNotes =
    "\nThe run's process log is kept beside the output as OUTROOT.log.  The\n"
    "installation data (catalogs, key files, parameter files, the auxiliary list)\n"
    "ship with the tool; each run works in a private folder beside the output,\n"
    "removed at the end.  Ctrl-C stops the run cleanly at its next progress step;\n"
    "a second Ctrl-C stops it at once.\n"
    "Exit status: 0 on success, 2 for a wrong command line, 130 after Ctrl-C, else\n"
    "the error code when below 256 and 255 for larger codes (the full code is\n"
    "printed).\n";

}  // namespace

bool IsCommandLineWord(const std::string& word) {
  return word == "import" || word == "multilook" || word == "help" || word == "--help" ||
         word == "-h" || word == "--version" || word == "-V";
}

std::string HelpText(Command command) {
  switch (command) {
    case Command::Import:
      return "usage: import_wss import PRODUCT [options]\n"
             "\n"
             "Imports an ENVISAT ASAR wide-swath SLC product (ASA_WSS_1P): writes one complex\n"
             "raster per sub-swath, OUTROOT1_slc to OUTROOT5_slc, with their headers\n"
             "(OUTROOTk_slc.sml, and OUTROOTk_slc.vrt for GDAL), and the list file\n"
             "OUTROOT naming the five rasters.  Without --xca, --ins or --aux-dir the\n"
             "auxiliary files are chosen from the installation's auxiliary list.\n"
             "\noptions:\n" +
             optionHelp(command) + kCommonNotes;
    case Command::Multilook:
      return "usage: import_wss multilook PRODUCT --orbit FILE [options]\n"
             "\n"
             "Imports an ENVISAT ASAR wide-swath SLC product as 'import' does, then\n"
             "multilooks the five sub-swaths into one power image of the whole swath:\n"
             "OUTROOT_gr in ground range or OUTROOT_pwr in slant range, with its headers\n"
             "(.sml, .hdr) and, with --tiff, a GeoTIFF copy (.tif).  Without --aux-dir the\n"
             "auxiliary files are chosen from the installation's auxiliary list.\n"
             "\noptions:\n" +
             optionHelp(command) + kCommonNotes;
    case Command::None:
      break;
  }
  return "usage: import_wss import PRODUCT [options]\n"
         "       import_wss multilook PRODUCT --orbit FILE [options]\n"
         "       import_wss --version\n"
         "\n"
         "Brings ENVISAT ASAR wide-swath SLC products into the suite's product format.\n"
         "  import      five sub-swath rasters with their headers\n"
         "  multilook   the import, then one multilooked power image of the whole swath\n"
         "'import_wss COMMAND --help' describes each command.\n";
}

bool ParseCommandLine(int argc, const char* const* argv, Options& o, std::string& error) {
  o = Options{};
  if (argc < 2) {
    error = "no command given";
    return false;
  }
  const std::string word = argv[1];
  if (word == "--version" || word == "-V") {
    o.version = true;
    return true;
  }
  if (word == "--help" || word == "-h" || word == "help") {
    o.help = true;
    return true;
  }
  if (word == "import") {
    o.command = Command::Import;
  } else if (word == "multilook") {
    o.command = Command::Multilook;
  } else {
    error = "unknown command '" + word + "'";
    return false;
  }
  std::vector<std::string> positional;
  bool optionsEnded = false;
  for (int i = 2; i < argc; ++i) {
    std::string arg = argv[i];
    if (optionsEnded || arg.size() < 2 || arg[0] != '-') {
      positional.push_back(arg);
      continue;
    }
    if (arg == "--") {
      optionsEnded = true;
      continue;
    }
    if (arg == "--help" || arg == "-h") {
      o.help = true;
      return true;
    }
    std::string value;
    bool inlineValue = false;
    const size_t eq = arg.find('=');
    if (arg.compare(0, 2, "--") == 0 && eq != std::string::npos) {
      value = arg.substr(eq + 1);
      arg.resize(eq);
      inlineValue = true;
    }
    const OptionRow* row = findOption(o.command, arg);
    if (row == nullptr) {
      error = "unknown option '" + arg + "' for '" + word + "'";
      return false;
    }
    if (row->value != nullptr && !inlineValue && row->takesNext) {
      if (i + 1 < argc && row->takesNext(argv[i + 1])) value = argv[++i];
    } else if (row->value != nullptr && !inlineValue) {
      if (i + 1 >= argc) {
        error = std::string("option ") + row->name + " needs a value (" + row->value + ")";
        return false;
      }
      value = argv[++i];
    } else if (row->value == nullptr && inlineValue) {
      error = std::string("option ") + row->name + " takes no value";
      return false;
    }
    if (!row->apply(o, value, error)) return false;
  }
  if (positional.empty()) {
    error = "'" + word + "' needs a PRODUCT";
    return false;
  }
  if (positional.size() > 1) {
    error = "unexpected argument '" + positional[1] + "'";
    return false;
  }
  o.product = positional[0];
  if (o.command == Command::Multilook) {
    if (o.orbit.empty()) {
      error = "'multilook' needs the orbit file: --orbit FILE";
      return false;
    }
    if (o.saturationGiven && !o.tiff) {
      error = "--saturation applies to the TIFF copy: add --tiff";
      return false;
    }
    if (o.mapSpacing > 0.0 && !o.geocode) {
      error = "--spacing applies to the geocoded copy: add --geocode";
      return false;
    }
  }
  return true;
}

}  // namespace vlr::cli
