#include "cli/command_line.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "cli/aux_choice.h"
#include "cli/cli_options.h"
#include "cli/host_child.h"
#include "cli/progress_display.h"
#include "cli/run_folder.h"
#include "cli/run_summary.h"
#include "entry/command.h"
#include "envisat/envisat_types.h"
#include "runtime/error_codes.h"
#include "time/date_text.h"

#ifndef VLR_VERSION
#define VLR_VERSION "0.0.0"
#endif

namespace vlr::cli {

namespace {

namespace fs = std::filesystem;

constexpr int kStatusUsage = 2;
constexpr int kStatusInterrupted = 130;
constexpr int kStatusFailed = 1;
constexpr int kSubSwaths = 5;
// The drivers keep file names in fields of 512 characters.
constexpr size_t kPathMax = 500;
constexpr int kArguments = 14;
constexpr const char* kNotOK = "NotOK";
// The multilook parameter file of the installation.
constexpr const char* kMultilookParameters = "parameters_multilook.hdr";

// A failure found before the run starts: message, exit status.
struct Failure {
  std::string message;
  int status = kStatusFailed;
};

// Absolute, normalised form of a path as given.
std::string absolutePath(const std::string& path) {
  std::error_code ec;
  fs::path p = fs::absolute(path, ec);
  if (ec) p = path;
  return p.lexically_normal().string();
}

// The argument-list file and the configuration are line-based: a name must
// stay one line, keep its blanks and fit the drivers' name fields.
bool usableName(const std::string& path, const char* what, Failure& f) {
  const bool bad = path.size() > kPathMax || path.find_first_of("\n\r") != std::string::npos ||
                   path.find("###Veloran###") != std::string::npos ||
                   (!path.empty() && (path.back() == ' ' || path.back() == '\t'));
  if (bad) f.message = std::string(what) + " has a name the tool cannot pass on: '" + path + "'";
  return !bad;
}

// An input file that must exist, be a regular file and open for reading.
bool readableFile(const std::string& path, const char* what, Failure& f) {
  struct stat st {};
  if (stat(path.c_str(), &st) != 0) {
    f.message = std::string(what) + " " + path + ": " + std::strerror(errno);
    return false;
  }
  if (!S_ISREG(st.st_mode)) {
    f.message = std::string(what) + " " + path + " is not a regular file";
    return false;
  }
  if (access(path.c_str(), R_OK) != 0) {
    f.message = std::string(what) + " " + path + ": " + std::strerror(errno);
    return false;
  }
  return usableName(path, what, f);
}

bool sameFile(const std::string& a, const std::string& b) {
  struct stat sa {
  }, sb{};
  return stat(a.c_str(), &sa) == 0 && stat(b.c_str(), &sb) == 0 && sa.st_dev == sb.st_dev &&
         sa.st_ino == sb.st_ino;
}

// The default output root: the product's name without its extension
// (".N1"), in the current folder.
std::string defaultRoot(const std::string& product) {
  std::string name = fs::path(product).filename().string();
  const size_t dot = name.rfind('.');
  if (dot != std::string::npos && dot > 0 && name.size() - dot <= 4) name.resize(dot);
  return absolutePath(name);
}

// Every file a run over root may write.
std::vector<std::string> outputNames(const std::string& root, const Options& o) {
  std::vector<std::string> names = {root, root + ".log"};
  for (int k = 1; k <= kSubSwaths; ++k) {
    const std::string r = root + std::to_string(k);
    for (const char* s : {"", ".hdr", "_pattern", "_slc", "_slc.sml", "_slc.hdr", "_slc_hdr", "_slc.vrt"})
      names.push_back(r + s);
  }
  if (o.command == Command::Multilook) {
    const std::string out = root + (o.groundRange ? "_gr" : "_pwr");
    for (const char* s : {"", ".hdr", ".sml", "_hdr", ".tif", ".tfw", ".kml"})
      names.push_back(out + s);
  }
  return names;
}

std::string dateText(double t) {
  char text[kSec85TextSize] = {};
  if (sec852myascii(t, text) != 0) return "?";
  return text;
}

// Chooses the auxiliary file of type from dir for the product; the message
// names the date and the folder when none is valid.
bool chooseFromFolder(const std::string& dir, const std::string& type, double sensingStart,
                      AuxFileName& chosen, Failure& f) {
  std::vector<std::string> names;
  if (!ListFolder(dir, names, f.message)) return false;
  if (!ChooseAuxFile(names, type, sensingStart, chosen)) {
    f.message = "no " + type + " file in " + dir + " is valid at the product's sensing start " +
                dateText(sensingStart);
    return false;
  }
  return true;
}

// The shipped multilook parameters with the geocoded copy switched on: the
// shipped "[Geocoding]" section is replaced by one with the command line's
// map.
bool geocodeParameters(const std::string& shipped, const Options& o, const std::string& path,
                       std::string& error) {
  std::ifstream in(shipped);
  if (!in) {
    error = "cannot read " + shipped;
    return false;
  }
  std::string text, line;
  bool inGeocoding = false;
  while (std::getline(in, line)) {
    if (!line.empty() && line[0] == '[') inGeocoding = line.rfind("[Geocoding]", 0) == 0;
    if (!inGeocoding) text += line + "\n";
  }
  char section[160];
  std::snprintf(section, sizeof section,
                "\n[Geocoding]\nGeocode = 1\nMapEPSG = %d\nMapSpacing = %.17g\nGroundHeight = 0\n",
                o.mapEpsg, o.mapSpacing);
  return WriteTextFile(path, text + section, error);
}

// The description folder of a multilook with auxiliary files of its own
// (when auxDir is set: the two chosen files and an auxiliary list naming
// them) or with the geocoded copy (its own parameter file); everything else
// is the shipped description files.
bool privateDescriptions(const RunFolder& run, const std::string& dataDes, const Options& o,
                         const std::string& auxDir, const AuxFileName& xca, const AuxFileName& ins,
                         std::string& desDir, Failure& f) {
  desDir = run.path() + "des/";
  std::error_code ec;
  fs::create_directory(desDir, ec);
  if (ec) {
    f.message = "cannot create " + desDir + ": " + ec.message();
    return false;
  }
  const bool ownAux = !auxDir.empty();
  for (const fs::directory_entry& e : fs::directory_iterator(dataDes, ec)) {
    const std::string name = e.path().filename().string();
    if (ownAux && (name == "ASA_AUX_list.dat" || name == xca.name || name == ins.name)) continue;
    if (o.geocode && name == kMultilookParameters) continue;
    fs::create_symlink(e.path(), desDir + name, ec);
  }
  if (o.geocode && !geocodeParameters(dataDes + kMultilookParameters, o,
                                      desDir + kMultilookParameters, f.message))
    return false;
  if (!ownAux) return true;
  std::string list;
  for (const AuxFileName* a : {&xca, &ins}) {
    fs::create_symlink(fs::path(auxDir) / a->name, desDir + a->name, ec);
    if (ec) {
      f.message = "cannot link " + a->name + " into " + desDir + ": " + ec.message();
      return false;
    }
    list += std::string("[") + (a == &xca ? "ASA_XCA" : "ASA_INS") +
            "_0]\nStartDate = " + dateText(a->validFrom) + "\nStopDate = " + dateText(a->validTo) +
            "\nFileName = " + a->name + "\n";
  }
  return WriteTextFile(desDir + "ASA_AUX_list.dat", list, f.message);
}

void noteChoice(ProgressDisplay& progress, const char* what, const std::string& dir,
                const AuxFileName& a) {
  progress.note(std::string(what) + ": " + dir + a.name + " (valid " + dateText(a.validFrom) +
                " to " + dateText(a.validTo) + ")");
}

// Keeps the run's process log beside the output.
void keepLog(const RunFolder& run, const std::string& root) {
  const std::string target = root + ".log";
  if (std::rename(run.processLog().c_str(), target.c_str()) != 0) {
    std::error_code ec;
    fs::copy_file(run.processLog(), target, fs::copy_options::overwrite_existing, ec);
  }
}

int fail(const Failure& f) {
  std::fprintf(stderr, "import_wss: %s\n", f.message.c_str());
  return f.status;
}

// The files a run reads, as absolute paths; empty when not given.
struct Inputs {
  std::string product, orbit, xca, ins;
};

// An optional input of an ENVISAT type: absolute, readable, of that type.
bool checkTyped(const std::string& given, const char* what, int (*isType)(const char*),
                const char* typeText, std::string& path, Failure& f) {
  if (given.empty()) return true;
  path = absolutePath(given);
  if (!readableFile(path, what, f)) return false;
  if (isType(path.c_str()) == 0) {
    f.message = path + " is not " + typeText;
    return false;
  }
  return true;
}

int isOrbit(const char* path) {
  return EnvisatTypes::is_dorvor(path) || EnvisatTypes::is_dorpor(path);
}

bool checkInputs(const Options& o, Inputs& in, Failure& f) {
  return checkTyped(o.product, "product", EnvisatTypes::is_wss,
                    "an ASAR wide-swath SLC product (ASA_WSS_1P)", in.product, f) &&
         checkTyped(o.orbit, "orbit file", isOrbit, "a DORIS orbit file (DOR_VOR or DOR_POR)",
                    in.orbit, f) &&
         checkTyped(o.xca, "calibration file", EnvisatTypes::is_xca,
                    "an external calibration file (ASA_XCA)", in.xca, f) &&
         checkTyped(o.ins, "instrument file", EnvisatTypes::is_ins,
                    "an instrument characterisation file (ASA_INS)", in.ins, f);
}

// The output root: a file root in an existing folder, none of whose outputs
// is one of the inputs.
bool checkOutput(const Options& o, const Inputs& in, std::string& root, Failure& f) {
  root = o.outRoot.empty() ? defaultRoot(in.product) : absolutePath(o.outRoot);
  const fs::path rootPath(root);
  std::error_code ec;
  if (rootPath.filename().empty() || fs::is_directory(root, ec)) {
    f = {"the output root " + o.outRoot + " names a folder, not a file root", kStatusUsage};
    return false;
  }
  if (!fs::is_directory(rootPath.parent_path(), ec)) {
    f.message = "the output folder " + rootPath.parent_path().string() + " does not exist";
    return false;
  }
  if (!usableName(root + "5_slc.sml", "the output root", f)) return false;
  const std::string* inputs[] = {&in.product, &in.orbit, &in.xca, &in.ins};
  for (const std::string& out : outputNames(root, o)) {
    for (const std::string* input : inputs) {
      if (!input->empty() && sameFile(out, *input)) {
        f.message = "the output " + out + " would overwrite the input " + *input +
                    "; choose another output root with -o";
        return false;
      }
    }
  }
  return true;
}

// The auxiliary files that --aux-dir chooses, for those not named.
struct AuxChoice {
  std::string dir;  // with a trailing '/'; empty without --aux-dir
  AuxFileName xca, ins;
};

bool chooseAux(const Options& o, Inputs& in, AuxChoice& choice, ProgressDisplay& progress,
               Failure& f) {
  if (o.auxDir.empty()) return true;
  choice.dir = absolutePath(o.auxDir);
  if (choice.dir.back() != '/') choice.dir += '/';
  double sensingStart = 0.0;
  if (!ProductSensingStart(in.product, sensingStart, f.message)) return false;
  const struct {
    const char* type;
    const char* what;
    std::string* path;
    AuxFileName* chosen;
  } kinds[] = {{"ASA_XCA", "Calibration file", &in.xca, &choice.xca},
               {"ASA_INS", "Instrument file", &in.ins, &choice.ins}};
  for (const auto& k : kinds) {
    if (!k.path->empty()) continue;
    if (!chooseFromFolder(choice.dir, k.type, sensingStart, *k.chosen, f)) return false;
    *k.path = choice.dir + k.chosen->name;
    if (!usableName(*k.path, k.what, f)) return false;
    noteChoice(progress, (std::string(k.what) + " (" + k.type + ")").c_str(), choice.dir,
               *k.chosen);
  }
  return true;
}

// The host's argument list of the command (positions as the drivers read
// them) and its command word.
std::vector<std::string> hostArguments(const Options& o, const Inputs& in, const std::string& root,
                                       std::string& word) {
  std::vector<std::string> args(kArguments, kNotOK);
  auto set = [&args](size_t position, const std::string& value) {
    if (!value.empty()) args[position] = value;
  };
  if (o.command == Command::Import) {
    word = "main_import_ESA#";
    set(0, in.product);
    set(1, in.orbit);
    set(2, in.xca);
    set(3, root);
    set(4, in.ins);
    return args;
  }
  word = "main_multilook_WSS#";
  set(0, in.product);
  set(1, root);
  set(2, in.orbit);
  set(6, o.groundRange ? "OK" : kNotOK);
  set(12, o.tiff ? "OK" : kNotOK);
  char saturation[32];
  std::snprintf(saturation, sizeof saturation, "%.10g", o.saturation);
  set(13, saturation);
  return args;
}

// Tells how the run ended; returns the exit status.
int reportOutcome(const Options& o, const Inputs& in, const AuxChoice& aux, const ChildResult& r,
                  const std::string& root, std::time_t started, ProgressDisplay& progress) {
  const std::string log = root + ".log";
  if (r.exitStatus == 0) {
    progress.finish(true);
    if (r.interrupted) {
      std::fprintf(stderr, "import_wss: the run had completed before it could stop\n");
    }
    if (!o.quiet) {
      std::fputs(Summary(WrittenFiles(root, started)).c_str(), stdout);
      std::fflush(stdout);
    }
    return 0;
  }
  progress.finish(false);
  if (r.signal != 0) {
    std::fprintf(stderr, "import_wss: the run ended abnormally (signal %d: %s); its log: %s\n",
                 r.signal, strsignal(r.signal), log.c_str());
    return r.interrupted ? kStatusInterrupted : 128 + r.signal;
  }
  if (r.exitStatus < 0) {
    std::fprintf(stderr, "import_wss: %s\n", r.message.c_str());
    return kStatusFailed;
  }
  if (r.interrupted) {
    std::fprintf(stderr, "import_wss: stopped by Ctrl-C (error %d: %s); its log: %s\n", r.code,
                 r.message.c_str(), log.c_str());
    return kStatusInterrupted;
  }
  if (r.code != 0) {
    std::fprintf(stderr, "import_wss: error %d: %s\n", r.code, r.message.c_str());
  } else {
    std::fprintf(stderr, "import_wss: the run failed with exit status %d\n", r.exitStatus);
  }
  // The installation's list is what failed when the run had to use it.
  const bool usedList =
      o.command == Command::Import ? (in.xca.empty() || in.ins.empty()) : aux.dir.empty();
  if (usedList && (r.code == kLibMissing || r.message.find("findaux") != std::string::npos)) {
    std::fprintf(stderr,
                 "import_wss: the installation's auxiliary list has no file for this product; "
                 "name them with --aux-dir%s\n",
                 o.command == Command::Import ? ", --xca or --ins" : "");
  }
  std::fprintf(stderr, "import_wss: the process log is %s\n", log.c_str());
  return r.exitStatus;
}

int runCommand(const Options& o, const EntryDrivers& drivers) {
  Failure f;
  std::string error;
  const std::string dataDir = FindDataDir(error);
  if (dataDir.empty()) return fail({error, kStatusFailed});
  Inputs in;
  std::string root;
  if (!checkInputs(o, in, f) || !checkOutput(o, in, root, f)) return fail(f);

  ProgressDisplay progress(stderr, isatty(STDERR_FILENO) == 1, o.quiet);
  AuxChoice aux;
  if (!chooseAux(o, in, aux, progress, f)) return fail(f);

  // The run's own folder beside the output.
  RunFolder run;
  if (!run.create(fs::path(root).parent_path().string(), error)) return fail({error});
  std::string desDir = dataDir + "des/";
  if (o.command == Command::Multilook && (!aux.dir.empty() || o.geocode) &&
      !privateDescriptions(run, dataDir + "des/", o, aux.dir, aux.xca, aux.ins, desDir, f))
    return fail(f);
  if (!run.prepare(dataDir, desDir, HelperDir(), error)) return fail({error});

  std::string word;
  std::string argumentText = "ARGUMENTS\n";
  for (const std::string& a : hostArguments(o, in, root, word)) argumentText += a + "\n";
  const std::string argumentFile = run.path() + "arguments.txt";
  if (!WriteTextFile(argumentFile, argumentText, error)) return fail({error});

  const std::time_t started = std::time(nullptr) - 1;
  const ChildResult r = RunHostCommand(word + argumentFile, run, drivers, progress);
  keepLog(run, root);
  return reportOutcome(o, in, aux, r, root, started, progress);
}

}  // namespace

bool IsCommandLine(int argc, char** argv) {
  if (argc < 2)
    return std::getenv("VELORAN_INIT_DIR") == nullptr && std::getenv("windir") == nullptr;
  if (IsCommandLineWord(argv[1])) return true;
  if (SelectCommand(argv[1], nullptr) != Tool::Unknown) return false;
  return std::getenv("VELORAN_INIT_DIR") == nullptr && std::getenv("windir") == nullptr;
}

int RunCommandLine(int argc, char** argv, const EntryDrivers& drivers) {
  Options o;
  std::string error;
  if (!ParseCommandLine(argc, argv, o, error)) {
    std::fprintf(stderr, "import_wss: %s\nTry 'import_wss%s --help'.\n", error.c_str(),
                 o.command == Command::Import      ? " import"
                 : o.command == Command::Multilook ? " multilook"
                                                   : "");
    return kStatusUsage;
  }
  if (o.version) {
    std::printf("import_wss %s\n", VLR_VERSION);
    return 0;
  }
  if (o.help) {
    std::fputs(HelpText(o.command).c_str(), stdout);
    return 0;
  }
  return runCommand(o, drivers);
}

}  // namespace vlr::cli
