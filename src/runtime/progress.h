// Progress protocol with the host through the working file.
#pragma once

// Writes the new percent (kept within 0..99) and message to the working file.
// Returns 1; a withdrawn run or a corrupt working file raises 326400.
int getAndSetPerc(int previous, int current, const char* message);
