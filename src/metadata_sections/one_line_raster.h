// Rasters of a single line (a chirp, an antenna pattern) and the window that
// covers the whole line.
#pragma once

#include "raster/buffer_io.h"
#include "raster/data_file.h"

// Describes `file` as one line of `samples` samples of `cellType`, with no
// row prefix, no header offset, least significant byte first.
void describeOneLine(DataFile* file, int samples, int cellType);
// The window of all samples of that line, transferred as `cellType`.
BufferIO oneLineWindow(DataFile* file, int samples, int cellType);
