// Progress protocol with the host through the working file.
#pragma once

// Writes the new percent (kept within 0..99) and message to the working file.
// Returns 1; a withdrawn run or a corrupt working file raises 326400.
int getAndSetPerc(int previous, int current, const char* message);

// Receives every progress event besides the working file: a step title
// with percent -1 whenever the process label changes, and each percent
// written to the working file with the message given for it (null when
// none).  The command line draws its progress display from it; the host
// protocol does not depend on it.
using VlrProgressObserver = void (*)(int percent, const char* title);
void VlrSetProgressObserver(VlrProgressObserver observer);
void VlrNotifyProgressObserver(int percent, const char* title);
