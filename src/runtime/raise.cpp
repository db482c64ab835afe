// The raise sequence, the warning sequence and the error recorder.
#include "runtime/raise.h"

#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "runtime/environment.h"
#include "runtime/error_catalog.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/run_outputs.h"
#include "runtime/suite_state.h"
#include "runtime/working_file.h"

using vlr_detail::suite;

namespace {

constexpr size_t kLabelMax = 24999;
constexpr size_t kFileMax = 259;
constexpr size_t kTextMax = 1025;
constexpr size_t kExtraMax = 1027;

std::string cut(const char* s, size_t n) {
  std::string r = s ? s : "";
  if (r.size() > n) r.resize(n);
  return r;
}

}  // namespace

CErrorExceptionManager::CErrorExceptionManager(int code, int line, const char* file,
                                               const char* label, const char* extra)
    : mLabel(cut(label, kLabelMax)),
      mFile(cut(file, kFileMax)),
      mLine(line),
      mCode(code),
      mGroup(code / vlr::kGroupSize),
      mIndex(code % vlr::kGroupSize - 1),
      mExtra(cut(extra, kExtraMax)) {
  NVLR_UTILITY_GetErrorTexts(NVLR_UTILITY_Catalog(VlrCatalog::Errors), code, mTitle, mText);
  if (mTitle.size() > kTextMax) mTitle.resize(kTextMax);
  if (mText.size() > kTextMax) mText.resize(kTextMax);
}

std::string VlrErrorExtraLines(int code, const char* const* texts, int count) {
  const int maxTotal = CVLR_MAX_LEN_IN_ERROR * CVLR_MAX_LINE_IN_ERROR;
  std::string out;
  int total = 0;
  for (int t = 0; t < count && t < CVLR_MAX_LINE_IN_ERROR; ++t) {
    if (texts[t] == nullptr) break;
    std::string text = texts[t];
    if (code >= vlr::kCodeWorkingFileNotDeleted && code <= vlr::kCodeFileAccess &&
        NVLR_UTILITY_EndsWith(text.c_str(), "_hdr")) {
      NVLR_UTILITY_RemoveSuffix(text, "_hdr");
      text += ".sml";
    }
    const int len = static_cast<int>(text.size());
    NVLR_UTILITY_TracePrint(
        "(aTotLen + aLen) [%d]\n(CVLR_MAX_LEN_IN_ERROR * CVLR_MAX_LINE_IN_ERROR) [%d]\n",
        total + len, maxTotal);
    if (len <= CVLR_MAX_LEN_IN_ERROR) {
      if (total + len < maxTotal) {
        out += text + "\n";
        total += len;
      }
      continue;
    }
    for (int i = 0; i < len && total < maxTotal; ++i) {
      if (i > 0 && i % CVLR_MAX_LEN_IN_ERROR == 0 && len - i > 5) out += '\n';
      out += text[i];
      ++total;
    }
    out += "\n";
  }
  return out;
}

std::string NVLR_UTILITY_RecordError(int code, const char* extra1, const char* extra2,
                                     const char* extra3) {
  auto& s = suite();
  if (s.hook) s.hook(code);
  const ErrorCatalog& catalog = s.errors;
  const char* extras[3] = {extra1, extra2, extra3};
  std::string body = NVLR_UTILITY_ErrorTitleLine(catalog, code) + "\n";
  body += NVLR_UTILITY_ErrorTextLine(catalog, code) + NVLR_UTILITY_Format(" [EC : %d]\n", code);
  body += VlrErrorExtraLines(code, extras, 3);
  body += "\n" + std::string(66, ' ') + "\n" + std::string(66, ' ') + "\n";

  // The host knows where to look only once the working file is known.
  if (!s.workingFile.empty()) {
    if (FILE* f = std::fopen((s.workingFile + "_error").c_str(), "w")) {
      std::fputs("-1\n", f);
      std::fputs(body.c_str(), f);
      std::fclose(f);
    }
    FILE* w = nullptr;
    for (int attempt = 0; attempt < kWorkingOpenAttempts; ++attempt) {
      w = std::fopen(s.workingFile.c_str(), "r+");
      if (w != nullptr || !VlrTransientOpenError(errno)) break;
      sleep(static_cast<unsigned>(attempt));
    }
    const std::string status = code == vlr::kCodeWarnings ? "-2\n" : "-1\n";
    if (w != nullptr) {
      VlrReadWorkingLine(w);
      const std::string second = VlrReadWorkingLine(w);
      std::rewind(w);
      std::fputs(status.c_str(), w);
      std::fputs((second + "\n").c_str(), w);
      std::fputs(body.c_str(), w);
      std::fflush(w);
      // Drop what an earlier, longer content left behind.
      if (ftruncate(fileno(w), std::ftell(w)) != 0) {
      }
      std::fclose(w);
    } else if (FILE* t = std::fopen((s.workingFile + "_tmp").c_str(), "w")) {
      std::fputs(status.c_str(), t);
      std::fputs("\n", t);
      std::fputs(body.c_str(), t);
      std::fclose(t);
    }
  }
  std::string stderrText = body.substr(0, body.size() - 2 * 67 - 1);
  std::fputs(stderrText.c_str(), stderr);
  std::fflush(stderr);
  return body;
}

void VlrTerminate(int code) {
  // A run that ends with a code leaves none of the files it began.
  if (code != 0) VlrRunOutputsDiscard();
  std::fflush(nullptr);
  std::_Exit(vlr::ExitStatusFor(code));
}

void NVLR_UTILITY_RaiseError(int code, const char* file, int line, const char* extra) {
  auto& s = suite();
  if (!s.loggingMode) {
    throw CErrorExceptionManager(code, line, file, s.processLabel.c_str(), extra);
  }
  // A failure inside the raise sequence itself (a full heap, a failing write
  // or copy of the closing sequence) ends the process with the first code;
  // nothing more is recorded.  The guard is set before anything allocates,
  // since an allocation failure raises again.
  if (s.raising) VlrTerminate(s.raisingCode);
  s.raising = true;
  s.raisingCode = code;
  // The partial outputs go before the host is told of the failure.
  VlrRunOutputsDiscard();
  if (!s.tableReady) VlrTerminate(code);
  const int savedErrno = errno;
  std::string title, text;
  NVLR_UTILITY_GetErrorTexts(s.errors, code, title, text);
  const char* extraText = extra ? extra : "";
  NVLR_UTILITY_RecordError(code, extra);
  NVLR_UTILITY_TracePrint("\nERROR : %s [%s] (%s) \n %s   %s\n    FILE=%s   LINE=%d  (errno = %d)",
                          title.c_str(), text.c_str(), extraText, s.processLabel.c_str(),
                          s.identification.c_str(), file ? file : "", line, savedErrno);
  NVLR_UTILITY_LogPrint("\n\n%s [ERROR ID : %d]\n  %s [%s]\n  %s \n\n", s.identification.c_str(),
                        code, title.c_str(), text.c_str(), extraText);
  NVLR_UTILITY_EndProcess(code, 1, 1);
  NVLR_UTILITY_ReleaseEnvironment();
  VlrTerminate(code);
}

void NVLR_UTILITY_RaiseWarning(int code, const char* file, int line, const char* extra) {
  auto& s = suite();
  std::string title, text;
  NVLR_UTILITY_GetErrorTexts(s.warnings, code, title, text);
  const char* extraText = extra ? extra : "";
  NVLR_UTILITY_TracePrint(
      "\nWARNING : %s [%s] (%s) \n %s   %s\n    FILE=%s   LINE=%d  (errno = %d)", title.c_str(),
      text.c_str(), extraText, s.processLabel.c_str(), s.identification.c_str(), file ? file : "",
      line, errno);
  NVLR_UTILITY_LogPrint("\n\nWARNING : [ERROR ID : %d] %s [%s]\n  %s \n\n", code, title.c_str(),
                        text.c_str(), extraText);
}
