// Process-wide state of the suite environment, shared by its source files.
#pragma once

#include <cstdio>
#include <string>
#include <utility>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_catalog.h"
#include "runtime/file_handle.h"

namespace vlr_detail {

struct SuiteState {
  bool tableReady = false;
  std::vector<std::pair<std::string, std::string>> table;
  bool loggingMode = false;
  bool traceOn = false;
  std::string identification;
  std::string processLabel = " -";
  std::string workingFile;
  std::string command;
  float noDataFloat = 0.0f;
  double noDataDouble = 0.0;
  ErrorCatalog errors;
  ErrorCatalog warnings;
  VlrErrorHook hook = nullptr;
  FileHandle log;
  FileHandle trace;
  // Set while the raise sequence runs, with the code it ends the process with.
  bool raising = false;
  int raisingCode = 0;
};

SuiteState& suite();
std::string workingDir();

}  // namespace vlr_detail
