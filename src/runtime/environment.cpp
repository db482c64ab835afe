// Settings table and start-up of the suite environment.
#include "runtime/environment.h"

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <limits>
#include <new>

#include "runtime/error_catalog.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/suite_state.h"

const char* const kVeloranIdentification = "Veloran Base ENVI 4.2.000 Aug 30 2010 ";

namespace {

constexpr const char* kModule = "vlr_enviroment";
constexpr const char* kConfigurationName = "Veloran_configuration.ini";
constexpr int kConfigurationLines = 14;
// Each configuration line is read into a buffer of this many characters.
constexpr int kConfigurationLineBuffer = 512;

// Names of the configuration lines, in file order.
const char* const kConfigurationNames[kConfigurationLines] = {
    "VELORAN_KEY_FILES_DIR",
    "VELORAN_MANDATORY_DIR",
    "VELORAN_WORKING_DIR",
    "VELORAN_EXE_DIR",
    "VELORAN_MAP_FILES_DIR",
    "VELORAN_CEOS_DES_FILES_DIR",
    "VELORAN_GCP_DATABASE_DIR",
    "VELORAN_TESSAL_DES_FILES_DIR",
    "VELORAN_OTHER_01_DES_FILES_DIR",
    "VELORAN_XML_SCHEMA_DES_FILES_DIR",
    "VELORAN_DEFAULT_BYTE_ORDER",
    "VELORAN_TRACING",
    "VELORAN_CONFIGURATION_LINE_13",
    "VELORAN_DUMMY_VALUE",
};

std::string withSlash(const char* dir) {
  std::string s = dir;
  if (s.empty() || s.back() != '/') s += '/';
  return s;
}

void noMemory() {
  NVLR_UTILITY_RaiseError(vlr::kCodeMemory, kModule, __LINE__, nullptr);
}

// Reads one configuration line; false at end of file.  A line longer than
// the line buffer is refused rather than split into two settings.
bool readConfigurationLine(FILE* f, int number, const std::string& path, std::string& out) {
  char buffer[kConfigurationLineBuffer];
  if (std::fgets(buffer, sizeof buffer, f) == nullptr) return false;
  out = buffer;
  if (!out.empty() && out.back() == '\n') {
    out.pop_back();
  } else if (out.size() == kConfigurationLineBuffer - 1 && std::fgetc(f) != EOF) {
    std::fclose(f);
    const std::string extra = NVLR_UTILITY_Format("%s line %d is too long", path.c_str(), number);
    NVLR_UTILITY_RaiseError(vlr::kCodeNoInitDir, kModule, __LINE__, extra.c_str());
  }
  // A single stray character behind a closing separator (such as the
  // carriage return of a DOS line end) is dropped.
  const size_t n = out.size();
  if (n >= 2 && out[n - 1] != '/' && out[n - 2] == '/') out.pop_back();
  return true;
}

}  // namespace

namespace vlr_detail {

SuiteState& suite() {
  static SuiteState* s = new SuiteState;  // lives until the process ends
  return *s;
}

std::string workingDir() {
  return NVLR_UTILITY_EnvValue("VELORAN_WORKING_DIR");
}

}  // namespace vlr_detail

using vlr_detail::suite;

void NVLR_UTILITY_InitEnvironment(int enable, const char* identification, int freshTrace) {
  auto& s = suite();
  s.traceOn = false;
  s.loggingMode = true;
  s.identification = identification ? identification : "";
  std::set_new_handler(noMemory);
  std::srand(static_cast<unsigned>(std::time(nullptr)));
  s.processLabel = " -";
  s.errors.clear();
  s.warnings.clear();
  s.hook = nullptr;
  s.table.clear();
  s.table.reserve(50);
  s.tableReady = true;

  const char* initDir = std::getenv("VELORAN_INIT_DIR");
  if (initDir == nullptr) initDir = std::getenv("windir");
  if (initDir == nullptr) NVLR_UTILITY_RaiseError(vlr::kCodeNoInitDir, kModule, __LINE__, "windir");
  const std::string configuration = withSlash(initDir) + kConfigurationName;

  std::string envWorkingDir;
  if (const char* w = std::getenv("VELORAN_WORKING_DIR")) envWorkingDir = withSlash(w);

  FILE* f = std::fopen(configuration.c_str(), "r");
  if (f == nullptr) {
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, configuration.c_str());
  }
  for (int k = 0; k < kConfigurationLines; ++k) {
    std::string line;
    if (!readConfigurationLine(f, k + 1, configuration, line)) {
      std::fclose(f);
      NVLR_UTILITY_RaiseError(vlr::kCodeNoInitDir, kModule, __LINE__, "");
    }
    if (k == 2 && !envWorkingDir.empty()) line = envWorkingDir;
    NVLR_UTILITY_SetEnv(line.c_str(), kConfigurationNames[k]);
  }
  std::fclose(f);

  if (const char* b = std::getenv("VELORAN_BATCH_DIR")) {
    const std::string batch = withSlash(b);
    NVLR_UTILITY_SetEnv(batch.c_str(), "VELORAN_BATCH_DIR");
  } else {
    NVLR_UTILITY_SetEnv(NVLR_UTILITY_EnvValue("VELORAN_WORKING_DIR").c_str(), "VELORAN_BATCH_DIR");
  }
  if (const char* wf = std::getenv("VELORAN_WORKING_FILE")) {
    s.workingFile = wf;
  } else {
    s.workingFile = NVLR_UTILITY_EnvValue("VELORAN_BATCH_DIR") + "Process.working";
  }

  const std::string dummy = NVLR_UTILITY_EnvValue("VELORAN_DUMMY_VALUE");
  if (dummy.compare(0, 3, "NaN") == 0) {
    s.noDataFloat = std::numeric_limits<float>::quiet_NaN();
    s.noDataDouble = std::numeric_limits<double>::quiet_NaN();
  } else {
    s.noDataDouble = std::atof(dummy.c_str());
    s.noDataFloat = static_cast<float>(s.noDataDouble);
  }

  if (const char* g = std::getenv("VELORAN_GCP_DATABASE_DIR")) {
    NVLR_UTILITY_SetEnv(withSlash(g).c_str(), "VELORAN_GCP_DATABASE_DIR");
  }

  if (enable != 0) {
    const std::string des = NVLR_UTILITY_EnvValue("VELORAN_CEOS_DES_FILES_DIR");
    s.errors = LoadErrorCatalog(des + "vlr_errors_catalog.des");
    s.warnings = LoadErrorCatalog(des + "vlr_warnings_catalog.des");
    VlrOpenProcessLog();
    VlrOpenTrace(freshTrace);
  }
}

bool NVLR_UTILITY_SetEnv(const char* value, const char* name) {
  auto& s = suite();
  const std::string v = value ? value : "";
  for (auto& entry : s.table) {
    if (entry.first == name) {
      entry.second = v;
      return true;
    }
  }
  s.table.emplace_back(name, v);
  return true;
}

bool NVLR_UTILITY_GetEnv(std::string& destination, const char* name) {
  for (const auto& entry : suite().table) {
    if (entry.first == name) {
      destination = entry.second;
      return true;
    }
  }
  return false;
}

int NVLR_UTILITY_GetEnvCode(std::string& destination, const char* name) {
  return NVLR_UTILITY_GetEnv(destination, name) ? 0 : -11;
}

std::string NVLR_UTILITY_EnvValue(const char* name) {
  std::string v;
  NVLR_UTILITY_GetEnv(v, name);
  return v;
}

bool NVLR_UTILITY_IsEnvironmentReady() {
  return suite().tableReady;
}

void NVLR_UTILITY_ReleaseEnvironment() {
  auto& s = suite();
  s.table.clear();
  s.table.shrink_to_fit();
  s.tableReady = false;
}

float NVLR_UTILITY_NoDataFloat() {
  return suite().noDataFloat;
}
double NVLR_UTILITY_NoDataDouble() {
  return suite().noDataDouble;
}
const std::string& NVLR_UTILITY_WorkingFile() {
  return suite().workingFile;
}
const std::string& NVLR_UTILITY_Identification() {
  return suite().identification;
}

void NVLR_UTILITY_SetCommandString(const char* command) {
  suite().command = command ? command : "";
}
const char* NVLR_UTILITY_CommandString() {
  return suite().command.c_str();
}

void NVLR_UTILITY_SetErrorHook(VlrErrorHook hook) {
  suite().hook = hook;
}

void NVLR_UTILITY_ResetForTesting() {
  auto& s = suite();
  s = vlr_detail::SuiteState{};
}
