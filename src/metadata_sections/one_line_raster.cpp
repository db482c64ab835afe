#include "metadata_sections/one_line_raster.h"

void describeOneLine(DataFile* file, int samples, int cellType) {
  file->pixels_per_line = samples;
  file->lines_per_image = 1;
  file->row_prefix = 0;
  file->header_offset = 0;
  file->cell_type = cellType;
  file->byte_order = 0;
}

BufferIO oneLineWindow(DataFile* file, int samples, int cellType) {
  BufferIO window(file);
  window.first_sample = 0;
  window.num_samples = samples;
  window.first_line = 0;
  window.num_lines = 1;
  window.output_type = cellType;
  return window;
}
