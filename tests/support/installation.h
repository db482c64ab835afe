// A throw-away installation of the tool, and the host's side of a run.
#pragma once

#include <map>
#include <string>
#include <vector>

namespace vlr_test {

struct RunResult {
  int status = -1;  // exit status, or -1 when the process did not exit normally
  std::string out;
  std::string err;
};

class TempInstallation {
 public:
  explicit TempInstallation(bool trace = false);
  ~TempInstallation();
  TempInstallation(const TempInstallation&) = delete;
  TempInstallation& operator=(const TempInstallation&) = delete;

  const std::string& root() const { return root_; }
  // The working folder, with a trailing '/'.
  std::string working() const { return root_ + "/working/"; }
  std::string workingFile() const { return working() + "Process.working"; }

  // Writes an argument-list file (a header line, then one argument a line).
  std::string writeArguments(const std::vector<std::string>& arguments,
                             const std::string& name = "args.txt") const;
  // The host's files: the working file with a percent and message, "_batch_ok".
  void hostFiles(int percent = 0, const std::string& message = "Starting") const;

  // Runs the tool with the command string as its arguments, with
  // VELORAN_INIT_DIR pointing here unless env overrides it (an empty value
  // removes the variable), and the given standard descriptors (0, 1, 2)
  // closed, as a careless host may start it.
  RunResult run(const std::string& command, const std::map<std::string, std::string>& env = {},
                const std::vector<int>& closed = {}) const;

  // Makes this installation the one the calling process initialises from.
  void useInProcess() const;

 private:
  std::string root_;
};

std::string ReadFile(const std::string& path);
// The text with every local time text ("Sun Dec 06 10:13:56 2026") replaced
// by "<TIME>", for comparing whole log records.
std::string MaskLocalTimes(const std::string& text);
void WriteFile(const std::string& path, const std::string& content);
bool Exists(const std::string& path);
std::string ToolPath();
std::string SourceDir();
// Runs a program with arguments and an environment, the given standard
// descriptors closed in it instead of captured; returns its result.
RunResult RunProgram(const std::vector<std::string>& argv,
                     const std::map<std::string, std::string>& env, bool inheritEnvironment,
                     const std::vector<int>& closedDescriptors = {});

}  // namespace vlr_test
