#include "cli/command_line.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <filesystem>
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
    for (const char* s : {"", ".hdr", "_slc", "_slc.sml", "_slc.hdr", "_slc_hdr", "_slc.vrt"})
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

// The description folder of a multilook with auxiliary files of its own:
// the shipped description files, and an auxiliary list naming the two
// chosen files.
bool privateDescriptions(const RunFolder& run, const std::string& dataDes,
                         const std::string& auxDir, const AuxFileName& xca, const AuxFileName& ins,
                         std::string& desDir, Failure& f) {
  desDir = run.path() + "des/";
  std::error_code ec;
  fs::create_directory(desDir, ec);
  if (ec) {
    f.message = "cannot create " + desDir + ": " + ec.message();
    return false;
  }
  for (const fs::directory_entry& e : fs::directory_iterator(dataDes, ec)) {
    const std::string name = e.path().filename().string();
    if (name == "ASA_AUX_list.dat" || name == xca.name || name == ins.name) continue;
    fs::create_symlink(e.path(), desDir + name, ec);
  }
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

int runCommand(const Options& o, const EntryDrivers& drivers) {
  Failure f;
  std::string error;
  const std::string dataDir = FindDataDir(error);
  if (dataDir.empty()) return fail({error, kStatusFailed});

  // Inputs.
  const std::string product = absolutePath(o.product);
  if (!readableFile(product, "product", f)) return fail(f);
  if (!EnvisatTypes::is_wss(product.c_str())) {
    f.message = product + " is not an ASAR wide-swath SLC product (ASA_WSS_1P)";
    return fail(f);
  }
  std::string orbit;
  if (!o.orbit.empty()) {
    orbit = absolutePath(o.orbit);
    if (!readableFile(orbit, "orbit file", f)) return fail(f);
    if (!EnvisatTypes::is_dorvor(orbit.c_str()) && !EnvisatTypes::is_dorpor(orbit.c_str())) {
      f.message = orbit + " is not a DORIS orbit file (DOR_VOR or DOR_POR)";
      return fail(f);
    }
  }
  std::string xca, ins;
  if (!o.xca.empty()) {
    xca = absolutePath(o.xca);
    if (!readableFile(xca, "calibration file", f)) return fail(f);
    if (!EnvisatTypes::is_xca(xca.c_str())) {
      f.message = xca + " is not an external calibration file (ASA_XCA)";
      return fail(f);
    }
  }
  if (!o.ins.empty()) {
    ins = absolutePath(o.ins);
    if (!readableFile(ins, "instrument file", f)) return fail(f);
    if (!EnvisatTypes::is_ins(ins.c_str())) {
      f.message = ins + " is not an instrument characterisation file (ASA_INS)";
      return fail(f);
    }
  }

  // Output.
  const std::string root = o.outRoot.empty() ? defaultRoot(product) : absolutePath(o.outRoot);
  const fs::path rootPath(root);
  const std::string outDir = rootPath.parent_path().string();
  std::error_code ec;
  if (rootPath.filename().empty() || fs::is_directory(root, ec)) {
    return fail(
        {"the output root " + o.outRoot + " names a folder, not a file root", kStatusUsage});
  }
  if (!fs::is_directory(outDir, ec)) {
    return fail({"the output folder " + outDir + " does not exist", kStatusFailed});
  }
  if (!usableName(root + "5_slc.sml", "the output root", f)) return fail(f);
  for (const std::string& out : outputNames(root, o)) {
    const std::string* inputs[] = {&product, &orbit, &xca, &ins};
    for (const std::string* in : inputs) {
      if (!in->empty() && sameFile(out, *in)) {
        f.message = "the output " + out + " would overwrite the input " + *in +
                    "; choose another output root with -o";
        return fail(f);
      }
    }
  }

  const bool terminal = isatty(STDERR_FILENO) == 1;
  ProgressDisplay progress(stderr, terminal, o.quiet);

  // Auxiliary files chosen by their names.
  AuxFileName xcaChoice, insChoice;
  std::string auxDir;
  if (!o.auxDir.empty()) {
    auxDir = absolutePath(o.auxDir);
    if (auxDir.back() != '/') auxDir += '/';
    double sensingStart = 0.0;
    if (!ProductSensingStart(product, sensingStart, f.message)) return fail(f);
    if (xca.empty()) {
      if (!chooseFromFolder(auxDir, "ASA_XCA", sensingStart, xcaChoice, f)) return fail(f);
      xca = auxDir + xcaChoice.name;
      if (!usableName(xca, "calibration file", f)) return fail(f);
      noteChoice(progress, "Calibration file (ASA_XCA)", auxDir, xcaChoice);
    }
    if (ins.empty()) {
      if (!chooseFromFolder(auxDir, "ASA_INS", sensingStart, insChoice, f)) return fail(f);
      ins = auxDir + insChoice.name;
      if (!usableName(ins, "instrument file", f)) return fail(f);
      noteChoice(progress, "Instrument file (ASA_INS)", auxDir, insChoice);
    }
  }

  // The run's own folder beside the output.
  RunFolder run;
  if (!run.create(outDir, error)) return fail({error, kStatusFailed});
  std::string desDir = dataDir + "des/";
  if (o.command == Command::Multilook && !auxDir.empty() &&
      !privateDescriptions(run, dataDir + "des/", auxDir, xcaChoice, insChoice, desDir, f))
    return fail(f);
  if (!run.prepare(dataDir, desDir, HelperDir(), error)) return fail({error, kStatusFailed});

  std::vector<std::string> args(kArguments, kNotOK);
  std::string word;
  if (o.command == Command::Import) {
    word = "main_import_ESA#";
    args[0] = product;
    if (!orbit.empty()) args[1] = orbit;
    if (!xca.empty()) args[2] = xca;
    args[3] = root;
    if (!ins.empty()) args[4] = ins;
  } else {
    word = "main_multilook_WSS#";
    args[0] = product;
    args[1] = root;
    args[2] = orbit;
    args[6] = o.groundRange ? "OK" : kNotOK;
    args[12] = o.tiff ? "OK" : kNotOK;
    char saturation[32];
    std::snprintf(saturation, sizeof saturation, "%.10g", o.saturation);
    args[13] = saturation;
  }
  std::string argumentText = "ARGUMENTS\n";
  for (const std::string& a : args) argumentText += a + "\n";
  const std::string argumentFile = run.path() + "arguments.txt";
  if (!WriteTextFile(argumentFile, argumentText, error)) return fail({error, kStatusFailed});

  const std::time_t started = std::time(nullptr) - 1;
  const ChildResult r = RunHostCommand(word + argumentFile, run, drivers, progress);
  keepLog(run, root);
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
  if (o.command == Command::Import ? (xca.empty() || ins.empty()) : auxDir.empty()) {
    if (r.code == 10 || r.message.find("findaux") != std::string::npos)
      std::fprintf(stderr,
                   "import_wss: the installation's auxiliary list has no file for this product; "
                   "name them with --aux-dir%s\n",
                   o.command == Command::Import ? ", --xca or --ins" : "");
  }
  std::fprintf(stderr, "import_wss: the process log is %s\n", log.c_str());
  return r.exitStatus;
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
