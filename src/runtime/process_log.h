// "Process.log", "Process.trace", START and END records, closing sequence.
#pragma once

#include <string>
#include <vector>

bool NVLR_UTILITY_LogPrint(const char* format, ...) __attribute__((format(printf, 1, 2)));
bool NVLR_UTILITY_TracePrint(const char* format, ...) __attribute__((format(printf, 1, 2)));
bool NVLR_UTILITY_IsTraceOn();
void NVLR_UTILITY_FlushTrace();

void NVLR_UTILITY_SetProcessLabel(const char* title);
const std::string& NVLR_UTILITY_ProcessLabel();

void NVLR_UTILITY_WriteStart(const std::vector<std::string>& arguments, const char* title,
                             const char* parameterText);
void NVLR_UTILITY_WriteEnd();

// Closing sequence.  A non-zero code ends the process; code 0 returns.
void NVLR_UTILITY_EndProcess(int code, int writeLog, int successful);

// Local time as "Thu Dec 04 19:50:13 2026".
std::string NVLR_UTILITY_LocalTimeText();

// Opens "Process.log" for appending and the trace (internal to start-up).
void VlrOpenProcessLog();
void VlrOpenTrace(int fresh);
