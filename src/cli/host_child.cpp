#include "cli/host_child.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <vector>

#include "runtime/progress.h"

namespace vlr::cli {

namespace {

// Write end of the progress pipe in the child.
int gEventFd = -1;
// Interrupt requests seen by the command line.
volatile sig_atomic_t gInterrupts = 0;

constexpr int kPollMilliseconds = 200;
constexpr size_t kTitleMax = 200;

// Sends one event line: "S title" for a step, "P percent [message]" for a
// percent.  Lines stay far below PIPE_BUF, so each write is whole.
void sendEvent(int percent, const char* title) {
  if (gEventFd < 0) return;
  std::string t = title ? title : "";
  if (t.size() > kTitleMax) t.resize(kTitleMax);
  for (char& c : t) {
    if (c == '\n' || c == '\r') c = ' ';
  }
  char line[kTitleMax + 32];
  const int n = percent < 0 ? std::snprintf(line, sizeof line, "S %s\n", t.c_str())
                            : std::snprintf(line, sizeof line, "P %d %s\n", percent, t.c_str());
  if (n > 0) {
    const ssize_t w = write(gEventFd, line, static_cast<size_t>(n));
    (void)w;
  }
}

void onInterrupt(int) {
  gInterrupts = gInterrupts + 1;
}

// The host's environment variables that would send the child's files
// elsewhere than its run folder.
constexpr const char* kHostVariables[] = {"VELORAN_WORKING_DIR", "VELORAN_BATCH_DIR",
                                          "VELORAN_WORKING_FILE", "VELORAN_GCP_DATABASE_DIR",
                                          "windir"};

[[noreturn]] void runChild(const std::string& command, const RunFolder& folder,
                           const EntryDrivers& drivers, int eventFd) {
  // Ctrl-C reaches the whole process group, and a batch system's SIGTERM
  // every process of the job; the child stops through the withdrawal that
  // the parent starts instead.
  signal(SIGINT, SIG_IGN);
  signal(SIGTERM, SIG_IGN);
  signal(SIGPIPE, SIG_IGN);
  prctl(PR_SET_PDEATHSIG, SIGKILL);
  for (const char* v : kHostVariables) unsetenv(v);
  setenv("VELORAN_INIT_DIR", folder.path().c_str(), 1);
  // What the run writes to its standard streams goes to a file of the run
  // folder, so that the terminal keeps only the progress display.
  const std::string console = folder.path() + "console.txt";
  const int fd = open(console.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
  if (fd >= 0) {
    dup2(fd, STDOUT_FILENO);
    dup2(fd, STDERR_FILENO);
    close(fd);
  }
  gEventFd = eventFd;
  VlrSetProgressObserver(sendEvent);
  std::vector<char> word(command.begin(), command.end());
  word.push_back('\0');
  char name[] = "import_wss";
  char* argv[] = {name, word.data(), nullptr};
  const int code = RunEntry(2, argv, drivers);
  std::fflush(nullptr);
  _exit(code == 0 ? 0 : 1);
}

void handleLine(const std::string& line, ProgressDisplay& progress) {
  if (line.size() < 2) return;
  if (line[0] == 'S') {
    progress.step(line.substr(2));
  } else if (line[0] == 'P') {
    char* end = nullptr;
    const long percent = std::strtol(line.c_str() + 2, &end, 10);
    // A message given with a percent names the step it belongs to.
    if (*end == ' ' && end[1] != '\0') progress.stepIfNew(end + 1);
    progress.percent(static_cast<int>(percent));
  }
}

}  // namespace

int ReadErrorFile(const std::string& path, std::string& message) {
  std::ifstream in(path);
  if (!in) return 0;
  std::string line;
  std::getline(in, line);  // the status "-1"
  int code = 0;
  bool afterCode = false;
  std::string title, text, extra;
  while (std::getline(in, line)) {
    const size_t ec = line.find(" [EC : ");
    const bool codeLine = ec != std::string::npos && !afterCode;
    if (codeLine) {
      code = std::atoi(line.c_str() + ec + 7);
      line.resize(ec);
    }
    while (!line.empty() && line.back() == ' ') line.pop_back();
    if (codeLine) {
      text = line;
      afterCode = true;
    } else if (!afterCode) {
      if (title.empty()) title = line;
    } else if (line.empty()) {
      break;  // the extra lines end with an empty line
    } else {
      extra += (extra.empty() ? "" : " ") + line;
    }
  }
  message = title;
  if (!text.empty()) message += ": " + text;
  if (!extra.empty()) message += " (" + extra + ")";
  return code;
}

ChildResult RunHostCommand(const std::string& command, const RunFolder& folder,
                           const EntryDrivers& drivers, ProgressDisplay& progress) {
  ChildResult result;
  int fds[2];
  // Close-on-exec: a helper program the run starts must not hold the pipe
  // open after the run has ended.
  if (pipe2(fds, O_CLOEXEC) != 0) {
    result.message = std::string("cannot start the run: ") + std::strerror(errno);
    return result;
  }
  std::fflush(nullptr);
  gInterrupts = 0;
  struct sigaction action {};
  action.sa_handler = onInterrupt;
  sigemptyset(&action.sa_mask);
  struct sigaction oldInt {
  }, oldTerm{};
  sigaction(SIGINT, &action, &oldInt);
  sigaction(SIGTERM, &action, &oldTerm);

  const pid_t child = fork();
  if (child < 0) {
    close(fds[0]);
    close(fds[1]);
    sigaction(SIGINT, &oldInt, nullptr);
    sigaction(SIGTERM, &oldTerm, nullptr);
    result.message = std::string("cannot start the run: ") + std::strerror(errno);
    return result;
  }
  if (child == 0) {
    close(fds[0]);
    runChild(command, folder, drivers, fds[1]);
  }
  close(fds[1]);

  std::string pending;
  int handledInterrupts = 0;
  bool open = true;
  while (open) {
    if (gInterrupts > handledInterrupts) {
      handledInterrupts = gInterrupts;
      result.interrupted = true;
      if (handledInterrupts == 1) {
        // The same withdrawal as a host that deletes "_batch_ok": the run
        // stops at its next progress step with its own records.
        std::remove(folder.batchOk().c_str());
        progress.note("Stopping at the next step (Ctrl-C again to stop at once) ...");
      } else {
        kill(child, SIGKILL);
      }
    }
    pollfd p{fds[0], POLLIN, 0};
    const int ready = poll(&p, 1, kPollMilliseconds);
    if (ready < 0) {
      if (errno == EINTR) continue;
      break;
    }
    if (ready == 0) continue;
    char buffer[4096];
    const ssize_t n = read(fds[0], buffer, sizeof buffer);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) {
      open = false;
      break;
    }
    pending.append(buffer, static_cast<size_t>(n));
    size_t nl;
    while ((nl = pending.find('\n')) != std::string::npos) {
      handleLine(pending.substr(0, nl), progress);
      pending.erase(0, nl + 1);
    }
  }
  close(fds[0]);

  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) break;
    if (gInterrupts > handledInterrupts) {
      handledInterrupts = gInterrupts;
      result.interrupted = true;
      kill(child, SIGKILL);
    }
  }
  sigaction(SIGINT, &oldInt, nullptr);
  sigaction(SIGTERM, &oldTerm, nullptr);
  if (WIFEXITED(status)) {
    result.exitStatus = WEXITSTATUS(status);
  } else if (WIFSIGNALED(status)) {
    result.signal = WTERMSIG(status);
  }
  if (result.exitStatus != 0) {
    result.code = ReadErrorFile(folder.errorFile(), result.message);
  }
  return result;
}

}  // namespace vlr::cli
