#include "installation.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <regex>
#include <sstream>
#include <stdexcept>

extern char** environ;

namespace vlr_test {

std::string SourceDir() {
  return VLR_SOURCE_DIR;
}
std::string ToolPath() {
  return VLR_TOOL_PATH;
}

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::stringstream s;
  s << in.rdbuf();
  return s.str();
}

void WriteFile(const std::string& path, const std::string& content) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out << content;
}

std::string MaskLocalTimes(const std::string& text) {
  static const std::regex kLocalTime(R"([A-Za-z]{3} [A-Za-z]{3} \d\d \d\d:\d\d:\d\d \d{4})");
  return std::regex_replace(text, kLocalTime, "<TIME>");
}

bool Exists(const std::string& path) {
  struct stat st;
  return stat(path.c_str(), &st) == 0;
}

RunResult RunProgram(const std::vector<std::string>& argv,
                     const std::map<std::string, std::string>& env, bool inheritEnvironment,
                     const std::vector<int>& closedDescriptors) {
  std::map<std::string, std::string> vars;
  if (inheritEnvironment) {
    for (char** e = environ; *e; ++e) {
      const char* eq = std::strchr(*e, '=');
      if (eq) vars[std::string(*e, static_cast<size_t>(eq - *e))] = eq + 1;
    }
  }
  for (const auto& kv : env) {
    if (kv.second.empty()) {
      vars.erase(kv.first);
    } else {
      vars[kv.first] = kv.second;
    }
  }
  std::vector<std::string> envStrings;
  for (const auto& kv : vars) envStrings.push_back(kv.first + "=" + kv.second);
  std::vector<char*> envp;
  for (auto& s : envStrings) envp.push_back(s.data());
  envp.push_back(nullptr);
  std::vector<std::string> args = argv;
  std::vector<char*> cargv;
  for (auto& a : args) cargv.push_back(a.data());
  cargv.push_back(nullptr);

  char outName[] = "/tmp/vlr_out_XXXXXX";
  char errName[] = "/tmp/vlr_err_XXXXXX";
  const int outFd = mkstemp(outName);
  const int errFd = mkstemp(errName);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  auto isClosed = [&](int fd) {
    return std::find(closedDescriptors.begin(), closedDescriptors.end(), fd) !=
           closedDescriptors.end();
  };
  if (!isClosed(1)) posix_spawn_file_actions_adddup2(&actions, outFd, 1);
  if (!isClosed(2)) posix_spawn_file_actions_adddup2(&actions, errFd, 2);
  for (int fd : closedDescriptors) posix_spawn_file_actions_addclose(&actions, fd);
  pid_t pid;
  RunResult r;
  if (posix_spawn(&pid, cargv[0], &actions, nullptr, cargv.data(), envp.data()) == 0) {
    int wstatus = 0;
    waitpid(pid, &wstatus, 0);
    r.status = WIFEXITED(wstatus) ? WEXITSTATUS(wstatus) : -1;
  }
  posix_spawn_file_actions_destroy(&actions);
  close(outFd);
  close(errFd);
  r.out = ReadFile(outName);
  r.err = ReadFile(errName);
  unlink(outName);
  unlink(errName);
  return r;
}

TempInstallation::TempInstallation(bool trace) {
  char name[] = "/tmp/vlr_inst_XXXXXX";
  if (mkdtemp(name) == nullptr) throw std::runtime_error("mkdtemp failed");
  root_ = name;
  std::vector<std::string> argv = {"/bin/bash", SourceDir() + "/scripts/make-installation"};
  if (trace) argv.push_back("--trace");
  argv.push_back("--bin");
  argv.push_back(VLR_BIN_DIR);
  argv.push_back(root_);
  const RunResult r = RunProgram(argv, {}, true);
  if (r.status != 0) throw std::runtime_error("make-installation failed: " + r.err);
}

TempInstallation::~TempInstallation() {
  RunProgram({"/bin/rm", "-rf", root_}, {}, true);
}

std::string TempInstallation::writeArguments(const std::vector<std::string>& arguments,
                                             const std::string& name) const {
  std::string content = "ARGUMENTS\n";
  for (const auto& a : arguments) content += a + "\n";
  const std::string path = working() + name;
  WriteFile(path, content);
  return path;
}

void TempInstallation::hostFiles(int percent, const std::string& message) const {
  WriteFile(workingFile(), std::to_string(percent) + "\n" + message + "\n");
  WriteFile(workingFile() + "_batch_ok", "");
}

namespace {

std::map<std::string, std::string> toolEnvironment(const std::string& root,
                                                   const std::map<std::string, std::string>& env) {
  std::map<std::string, std::string> e = {
      {"VELORAN_INIT_DIR", root},   {"VELORAN_WORKING_DIR", ""},      {"VELORAN_BATCH_DIR", ""},
      {"VELORAN_WORKING_FILE", ""}, {"VELORAN_GCP_DATABASE_DIR", ""}, {"windir", ""}};
  for (const auto& kv : env) e[kv.first] = kv.second;
  return e;
}

}  // namespace

RunResult TempInstallation::run(const std::string& command,
                                const std::map<std::string, std::string>& env,
                                const std::vector<int>& closed) const {
  return RunProgram({ToolPath(), command}, toolEnvironment(root_, env), true, closed);
}

void TempInstallation::useInProcess() const {
  setenv("VELORAN_INIT_DIR", root_.c_str(), 1);
  unsetenv("VELORAN_WORKING_DIR");
  unsetenv("VELORAN_BATCH_DIR");
  unsetenv("VELORAN_WORKING_FILE");
  unsetenv("VELORAN_GCP_DATABASE_DIR");
}

}  // namespace vlr_test
