// An in-process installation for the suite library's tests.  Raises throw
// CErrorExceptionManager here instead of ending the process, so a test can
// check the code a failure raises.
#pragma once

#include <gtest/gtest.h>

#include <string>

#include "installation.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/raise.h"
#include "runtime/suite_state.h"

namespace vlr_test {

class SuiteTest : public ::testing::Test {
 protected:
  void SetUp() override {
    NVLR_UTILITY_ResetForTesting();
    inst_.useInProcess();
    NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
    vlr_detail::suite().loggingMode = false;
  }
  void TearDown() override { NVLR_UTILITY_ResetForTesting(); }

  std::string keyDir() const { return inst_.root() + "/keys/"; }
  std::string work(const std::string& name) const { return inst_.working() + name; }
  // Writes "<keys>/<section>.key".
  void writeKeyFile(const std::string& section, const std::string& content) const {
    WriteFile(keyDir() + section + ".key", content);
  }
  std::string processLog() const { return ReadFile(inst_.working() + "Process.log"); }

  TempInstallation inst_;
};

// The suite error code that the statement raises, or 0 when it raises none.
template <typename F>
int RaisedCode(F&& statement) {
  try {
    statement();
  } catch (const CErrorExceptionManager& e) {
    return e.code();
  }
  return 0;
}

}  // namespace vlr_test
