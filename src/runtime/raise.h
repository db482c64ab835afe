// The single raise sequence and the error recorder.
#pragma once

#include <string>

// The error record thrown while the environment is not in logging mode.
class CErrorExceptionManager {
 public:
  CErrorExceptionManager(int code, int line, const char* file, const char* label,
                         const char* extra);

  int code() const { return mCode; }
  int group() const { return mGroup; }
  int index() const { return mIndex; }
  int line() const { return mLine; }
  const std::string& label() const { return mLabel; }
  const std::string& file() const { return mFile; }
  const std::string& title() const { return mTitle; }
  const std::string& text() const { return mText; }
  const std::string& extra() const { return mExtra; }

 private:
  std::string mLabel;
  std::string mFile;
  int mLine;
  int mCode;
  int mGroup;
  int mIndex;
  std::string mTitle;
  std::string mText;
  std::string mExtra;
};

constexpr int CVLR_MAX_LEN_IN_ERROR = 48;
constexpr int CVLR_MAX_LINE_IN_ERROR = 3;

// Writes the error file and updates the working file; the extra texts may be
// null.  Returns the lines it wrote after the "-1" status line.
std::string NVLR_UTILITY_RecordError(int code, const char* extra1, const char* extra2 = nullptr,
                                     const char* extra3 = nullptr);

// The lines the recorder writes for the extra texts (48 x 3 layout).
std::string VlrErrorExtraLines(int code, const char* const* texts, int count);

[[noreturn]] void NVLR_UTILITY_RaiseError(int code, const char* file, int line, const char* extra);
void NVLR_UTILITY_RaiseWarning(int code, const char* file, int line, const char* extra);

// Ends the process with the exit status of code (see ExitStatusFor).
[[noreturn]] void VlrTerminate(int code);
