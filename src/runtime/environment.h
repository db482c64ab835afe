// Suite environment: the settings table filled from "Veloran_configuration.ini"
// and the process environment, the no-data value and the process-wide state
// that the log, the raise sequence and the progress protocol share.
#pragma once

#include <string>

// Identification text of this program; heads START lines and ERROR blocks.
extern const char* const kVeloranIdentification;

// Builds the table, reads the configuration, loads the catalogs and opens
// "Process.log" (and the trace when "VELORAN_TRACING" is "ACTIVE").
void NVLR_UTILITY_InitEnvironment(int enable, const char* identification, int freshTrace);

bool NVLR_UTILITY_SetEnv(const char* value, const char* name);
// Copies the value of name into the destination; false when absent.
bool NVLR_UTILITY_GetEnv(std::string& destination, const char* name);
// 0 when found, -11 when absent.
int NVLR_UTILITY_GetEnvCode(std::string& destination, const char* name);
// The value of name, empty when absent.
std::string NVLR_UTILITY_EnvValue(const char* name);
bool NVLR_UTILITY_IsEnvironmentReady();
void NVLR_UTILITY_ReleaseEnvironment();

float NVLR_UTILITY_NoDataFloat();
double NVLR_UTILITY_NoDataDouble();

// Full path of the host's working file ("" before the configuration is read).
const std::string& NVLR_UTILITY_WorkingFile();
const std::string& NVLR_UTILITY_Identification();

// The command string kept by the entry point, for the trace.
void NVLR_UTILITY_SetCommandString(const char* command);
const char* NVLR_UTILITY_CommandString();

// Replaces the function the error recorder calls first with the error code.
using VlrErrorHook = void (*)(int code);
void NVLR_UTILITY_SetErrorHook(VlrErrorHook hook);

// Drops every piece of process-wide state: table, catalogs, streams, label.
// Used between independent runs inside one test process.
void NVLR_UTILITY_ResetForTesting();
