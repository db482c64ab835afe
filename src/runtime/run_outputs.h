// The files a run of the tool has begun to write.  A run that fails or is
// withdrawn removes them all before it ends, so the host never finds a
// partial product beside a failure code; a run that succeeds keeps them.
//
// Recording starts only when the entry point asks for it, so that library
// code used on its own (and its tests) never has its files taken away.
// Files that were there before the run and that it did not write are never
// recorded, hence never removed.
#pragma once

// Starts recording for this process.
void VlrRunOutputsTrack();

// path was created or replaced by this run.  Recording the same path twice
// keeps one entry.  false when it cannot be recorded (recording off, name
// too long, table full); the run goes on either way.
bool VlrRunOutputBegun(const char* path);
// The run renamed a recorded file: the new name replaces the old one.
void VlrRunOutputMoved(const char* from, const char* to);
// The run removed a file itself (a temporary): it is forgotten.
void VlrRunOutputRemoved(const char* path);

// The run succeeded: every recorded file stays, and recording stops.
void VlrRunOutputsCommit();
// Removes every recorded file and stops recording.  Uses nothing but
// unlink(), so a signal handler may call it.
void VlrRunOutputsDiscard();

// The number of files recorded now.
int VlrRunOutputsCount();
