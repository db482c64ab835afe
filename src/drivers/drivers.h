// The two tools of the executable.  Each takes the argument text behind its
// command word and returns 0 or an error code.
#pragma once

int fvlr_main_import_esa(const char* argumentText);
int fvlr_main_multilook_wss(const char* argumentText);
