// Process log, trace, START and END records and the closing sequence.
#include "runtime/process_log.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <ctime>
#include <string>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/progress.h"
#include "runtime/raise.h"
#include "runtime/suite_state.h"

using vlr_detail::suite;

namespace {

constexpr const char* kModule = "vlr_enviroment";
constexpr size_t kPrintBuffer = 25000;
constexpr size_t kLabelMax = 80;
constexpr int64_t kTraceArchiveSize = 1000000;
constexpr int kDeleteAttempts = 30;

// Writes a whole record with one system call.  The process log is opened for
// appending, so a record from a run beside this one (sharing the working
// folder) lands before or after it, never inside it.
bool writeRecord(FILE* f, const char* text, size_t size) {
  if (f == nullptr) return false;
  if (std::fflush(f) != 0) return false;
  const int fd = fileno(f);
  while (size > 0) {
    const ssize_t n = ::write(fd, text, size);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) return false;
    text += n;
    size -= static_cast<size_t>(n);
  }
  return true;
}

bool writeRecord(FILE* f, const std::string& text) {
  return writeRecord(f, text.data(), text.size());
}

bool vprint(FILE* f, const char* format, va_list args) {
  if (f == nullptr) return false;
  char buffer[kPrintBuffer];
  const int n = std::vsnprintf(buffer, sizeof buffer, format, args);
  if (n < 0) return false;
  return writeRecord(f, buffer, std::min(static_cast<size_t>(n), sizeof buffer - 1));
}

std::string stars() {
  return std::string(160, '*');
}

// Writes text to the process log, then to the trace.
void logAndTrace(const std::string& text) {
  auto& s = suite();
  writeRecord(s.log.get(), text);
  if (s.traceOn) writeRecord(s.trace.get(), text);
}

// Reserves an archive name in dir: head, the timestamp and tail, created
// empty and exclusively so that a run ending at the same microsecond in the
// same folder never copies over this run's archive; on a clash the process
// id and a count follow the timestamp.
std::string reserveArchive(const std::string& dir, const char* head, const char* tail) {
  const std::string stamp = NVLR_UTILITY_Timestamp();
  std::string path = dir + head + stamp + tail;
  for (int clash = 0; clash < 100; ++clash) {
    if (clash > 0) {
      path = dir + head + stamp +
             NVLR_UTILITY_Format("_%ld_%d", static_cast<long>(getpid()), clash) + tail;
    }
    const int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_EXCL, 0666);
    if (fd >= 0) {
      ::close(fd);
      return path;
    }
    if (errno != EEXIST) break;
  }
  // The copy reports what stands in the way.
  return path;
}

void closeTrace() {
  auto& s = suite();
  s.trace.reset();
  s.traceOn = false;
}

}  // namespace

bool NVLR_UTILITY_LogPrint(const char* format, ...) {
  va_list args;
  va_start(args, format);
  const bool ok = vprint(suite().log.get(), format, args);
  va_end(args);
  return ok;
}

bool NVLR_UTILITY_TracePrint(const char* format, ...) {
  auto& s = suite();
  if (!s.traceOn) return true;
  va_list args;
  va_start(args, format);
  const bool ok = vprint(s.trace.get(), format, args);
  va_end(args);
  return ok;
}

bool NVLR_UTILITY_IsTraceOn() {
  return suite().traceOn;
}

void NVLR_UTILITY_FlushTrace() {
  auto& s = suite();
  if (s.traceOn && s.trace) std::fflush(s.trace.get());
}

void NVLR_UTILITY_SetProcessLabel(const char* title) {
  std::string label = " ";
  label += title ? title : "";
  if (label.size() > kLabelMax) label.resize(kLabelMax);
  for (char& c : label) {
    if (c == '\n') c = ' ';
  }
  suite().processLabel = label;
  VlrNotifyProgressObserver(-1, title ? title : "");
}

const std::string& NVLR_UTILITY_ProcessLabel() {
  return suite().processLabel;
}

std::string NVLR_UTILITY_LocalTimeText() {
  const std::time_t now = std::time(nullptr);
  std::tm tm{};
  localtime_r(&now, &tm);
  static const char* const kDays[] = {"Sun", "Mon", "Tue", "Wed", "Thu", "Fri", "Sat"};
  static const char* const kMonths[] = {"Jan", "Feb", "Mar", "Apr", "May", "Jun",
                                        "Jul", "Aug", "Sep", "Oct", "Nov", "Dec"};
  char buffer[64];
  std::snprintf(buffer, sizeof buffer, "%s %s %02d %02d:%02d:%02d %04d", kDays[tm.tm_wday],
                kMonths[tm.tm_mon], tm.tm_mday, tm.tm_hour, tm.tm_min, tm.tm_sec,
                tm.tm_year + 1900);
  return buffer;
}

void NVLR_UTILITY_WriteStart(const std::vector<std::string>& arguments, const char* title,
                             const char* parameterText) {
  auto& s = suite();
  NVLR_UTILITY_SetProcessLabel(title);
  std::string text = "\n\n\n" + stars();
  text += NVLR_UTILITY_Format("\nSTART : %s  [ %s ]\n%s", title ? title : "",
                              s.identification.c_str(), NVLR_UTILITY_LocalTimeText().c_str());
  text += "\n" + stars() + "\n\n";
  if (parameterText != nullptr) {
    text += parameterText;
  } else {
    for (size_t i = 0; i < arguments.size(); ++i) {
      text +=
          NVLR_UTILITY_Format(" Parameter %d (%s)\n", static_cast<int>(i), arguments[i].c_str());
    }
  }
  text += "\n" + stars() + "\n\n";
  logAndTrace(text);
}

void NVLR_UTILITY_WriteEnd() {
  auto& s = suite();
  std::string text = "\n" + stars();
  text += NVLR_UTILITY_Format("\nEND : %s  -  %s\n", s.processLabel.c_str(),
                              NVLR_UTILITY_LocalTimeText().c_str());
  text += stars() + "\n\n";
  logAndTrace(text);
}

void VlrOpenProcessLog() {
  auto& s = suite();
  const std::string path = vlr_detail::workingDir() + "Process.log";
  // O_APPEND: every write goes to the end of the file as it is then, also
  // when other runs append to the same log.
  const int fd = ::open(path.c_str(), O_WRONLY | O_APPEND | O_CREAT, 0666);
  s.log = FileHandle(fd >= 0 ? fdopen(fd, "a") : nullptr);
  if (!s.log && fd >= 0) ::close(fd);
}

void VlrOpenTrace(int fresh) {
  auto& s = suite();
  const std::string tracing = NVLR_UTILITY_EnvValue("VELORAN_TRACING");
  if (tracing.compare(0, 6, "ACTIVE") != 0) return;
  const std::string dir = vlr_detail::workingDir();
  s.trace = FileHandle((dir + "Process.trace").c_str(), fresh ? "w" : "a");
  if (!s.trace) return;
  std::fputs("OpenTrace 1  2\n", s.trace.get());
  std::fflush(s.trace.get());
  s.traceOn = true;
  // The standard streams go to files beside the trace while it is on.
  std::fflush(stderr);
  std::fflush(stdout);
  if (!std::freopen((dir + "_cerr.txt").c_str(), "w", stderr)) return;
  if (!std::freopen((dir + "_cout.txt").c_str(), "w", stdout)) return;
  // The standard log stream shares the error stream's descriptor in C++; its
  // own file is created so that the host finds the usual three.
  if (FILE* clog = std::fopen((dir + "_clog.txt").c_str(), "w")) std::fclose(clog);
}

namespace {

// Deletes the working file at the end of a successful run, retrying while the
// host may still hold it; raises 261120 when it cannot be deleted.  The run
// judges its own deletion, not whether a file of that name exists afterwards:
// another run sharing the working file may already have written it anew, and
// that file is the other run's.
void deleteWorkingFile() {
  auto& s = suite();
  if (s.workingFile.empty() || !NVLR_UTILITY_FileExists(s.workingFile.c_str())) return;
  for (int attempt = 1; attempt <= kDeleteAttempts; ++attempt) {
    chmod(s.workingFile.c_str(), S_IRWXU);
    if (::unlink(s.workingFile.c_str()) == 0 || errno == ENOENT) return;
    const int wait = static_cast<int>(attempt * 0.1);
    if (wait > 0) sleep(static_cast<unsigned>(wait));
  }
  if (NVLR_UTILITY_FileExists(s.workingFile.c_str())) {
    NVLR_UTILITY_RaiseError(vlr::kCodeWorkingFileNotDeleted, kModule, __LINE__,
                            s.workingFile.c_str());
  }
}

}  // namespace

void NVLR_UTILITY_EndProcess(int code, int writeLog, int successful) {
  auto& s = suite();
  const std::string dir = vlr_detail::workingDir();
  const std::string tracePath = dir + "Process.trace";
  // The working file goes before the log is closed: a run whose working file
  // stays fails with 261120, and the log then records that failure (through
  // the raise sequence) instead of SUCCESSFUL.
  if (code == 0) deleteWorkingFile();
  if (writeLog) {
    if (code != 0) {
      NVLR_UTILITY_LogPrint("\n\n-%s   %s\n\n%s\n\nERROR :\n  %s\n\n", s.processLabel.c_str(),
                            s.identification.c_str(), NVLR_UTILITY_LocalTimeText().c_str(), " ");
    } else if (successful) {
      NVLR_UTILITY_LogPrint("\n\nSUCCESSFUL\n\n%s\n\n", NVLR_UTILITY_LocalTimeText().c_str());
    }
    NVLR_UTILITY_WriteEnd();
    s.log.reset();
    closeTrace();
    if (!dir.empty() && NVLR_UTILITY_FileExists((dir + "Process.trace_save").c_str())) {
      const std::string copy = reserveArchive(dir, "Process", ".trace");
      NVLR_UTILITY_CopyFile(tracePath.c_str(), copy.c_str());
      sleep(1);
    }
  }
  if (code != 0 && !dir.empty() && NVLR_UTILITY_FileExists(tracePath.c_str())) {
    const std::string copy = reserveArchive(dir, "Veloran_", "_trace.txt");
    NVLR_UTILITY_CopyFile(tracePath.c_str(), copy.c_str());
  }
  if (!dir.empty() && NVLR_UTILITY_FileSize(tracePath.c_str()) > kTraceArchiveSize) {
    const std::string copy = reserveArchive(dir, "Veloran_", "_trace.txt");
    NVLR_UTILITY_CopyFile(tracePath.c_str(), copy.c_str());
    chmod(tracePath.c_str(), S_IRWXU);
    std::remove(tracePath.c_str());
  }
  if (code != 0) VlrTerminate(code);
}
