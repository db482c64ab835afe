// The installation data that ship with the tool, and the private folder one
// run of the command line works in.
#pragma once

#include <string>

namespace vlr::cli {

// The shipped installation data: "../share/import_wss" from the folder of
// the running executable (the installed layout, and the build tree, which
// mirrors it).  Its keys/, mandatory/, maps/ and des/ folders are read only.
// Returns the folder with a trailing '/', or "" with a message in error.
std::string FindDataDir(std::string& error);

// Folder of the running executable, with a trailing '/'.
std::string ExecutableDir();
// Folder of the helper programs (main_delete_file): "../lib/import_wss/"
// from the executable's folder when installed, else that folder itself.
std::string HelperDir();

// A private folder for one run, created inside a parent folder: it holds the
// run's configuration file, Process.log, the working file with its
// "_batch_ok" and "_error" files, and what the run writes to its standard
// streams.  The destructor removes it with everything in it.
class RunFolder {
 public:
  RunFolder() = default;
  ~RunFolder();
  RunFolder(const RunFolder&) = delete;
  RunFolder& operator=(const RunFolder&) = delete;

  // Creates the folder in parent; false with a message in error.
  bool create(const std::string& parent, std::string& error);
  // Writes "Veloran_configuration.ini" for the data in dataDir, with desDir as
  // the description folder, this folder as the working folder and exeDir as
  // the folder of the helper programs; and the host's working file and
  // "_batch_ok".  False with a message in error.
  bool prepare(const std::string& dataDir, const std::string& desDir, const std::string& exeDir,
               std::string& error);

  // With a trailing '/'.
  const std::string& path() const { return path_; }
  std::string workingFile() const { return path_ + "Process.working"; }
  std::string batchOk() const { return workingFile() + "_batch_ok"; }
  std::string errorFile() const { return workingFile() + "_error"; }
  std::string processLog() const { return path_ + "Process.log"; }

 private:
  std::string path_;
};

// Writes text to path; false with a message in error.
bool WriteTextFile(const std::string& path, const std::string& text, std::string& error);

}  // namespace vlr::cli
