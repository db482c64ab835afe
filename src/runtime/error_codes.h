// Suite error codes: group = code / 65280, index = code % 65280 - 1.
#pragma once

namespace vlr {

constexpr int kGroupSize = 65280;

constexpr int kCodeWarnings = 65280;
constexpr int kCodeProcessingStepFailed = 130560;
constexpr int kCodeRasterNotComplete = 130561;
constexpr int kCodeMemory = 195840;
constexpr int kCodeWorkingFileNotDeleted = 261120;
constexpr int kCodeFileNotParsed = 261121;
constexpr int kCodeFileNotFound = 261122;
constexpr int kCodeFileCopy = 261123;
constexpr int kCodeFileWrite = 261124;
constexpr int kCodeFileRead = 261125;
constexpr int kCodeFileAccess = 261126;
constexpr int kCodeLineTooLong = 261127;
constexpr int kCodeBatchWithdrawn = 326400;
constexpr int kCodeMapState = 456960;
constexpr int kCodeBadArgument = 456962;
constexpr int kCodeUnknownCommand = 456963;
constexpr int kCodeNoInitDir = 783360;
constexpr int kCodeKeyFileMissing = 848640;
constexpr int kCodeFieldNotFound = 848642;
constexpr int kCodeFieldType = 848644;
constexpr int kCodeException = 913920;
constexpr int kCodeRasterException = 913921;

// Library result codes of the processing libraries.
constexpr int kLibOk = 0;
constexpr int kLibInconsistent = 1;
constexpr int kLibRead = 4;
constexpr int kLibWrite = 5;
constexpr int kLibAlloc = 7;
constexpr int kLibOpen = 9;
constexpr int kLibMissing = 10;

// Linux keeps only the low 8 bits of an exit status, and every multiple of
// 65280 would read as success there.  A code in 1..255 is its own status;
// any other non-zero code becomes 255.  The full code is always written to
// the error file and the process log.
inline int ExitStatusFor(long code) {
  if (code == 0) return 0;
  if (code >= 1 && code <= 255) return static_cast<int>(code);
  return 255;
}

}  // namespace vlr
