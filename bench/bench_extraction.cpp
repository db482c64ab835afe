// Times the extraction of an ASAR wide-swath product into its five rasters
// and headers, the way the import runs it, and prints the wall time, the
// samples copied and the peak resident memory.
//
//   bench_extraction PRODUCT OUTPUT_ROOT [DORIS]
#include <sys/resource.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "extraction/images.h"
#include "runtime/suite_state.h"

int main(int argc, char** argv) {
  if (argc < 3) {
    std::fprintf(stderr, "usage: %s PRODUCT OUTPUT_ROOT [DORIS]\n", argv[0]);
    return 2;
  }
  // The host's working file, so that the copy's progress bar can report.
  const std::string working = std::string(argv[2]) + ".working";
  for (const std::string& f : {working, working + "_batch_ok"}) {
    std::FILE* w = std::fopen(f.c_str(), "w");
    if (w == nullptr) return 2;
    std::fclose(w);
  }
  vlr_detail::suite().workingFile = working;

  images_conf conf;
  images ex(conf);
  std::snprintf(ex.input.ASA_level1_filename, kImagesNameSize, "%s", argv[1]);
  std::snprintf(ex.output.OutputFile, kImagesNameSize, "%s", argv[2]);
  if (argc > 3) std::snprintf(ex.input.ASA_dor_vor, kImagesNameSize, "%s", argv[3]);
  const auto start = std::chrono::steady_clock::now();
  const int rc = ex.run();
  const double seconds =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
  std::remove(working.c_str());
  std::remove((working + "_batch_ok").c_str());
  if (rc != 0) {
    std::fprintf(stderr, "extraction failed with %d\n", rc);
    return 1;
  }
  rusage usage{};
  getrusage(RUSAGE_SELF, &usage);
  std::printf("seconds %.3f\npeak_rss_mib %.1f\n", seconds, usage.ru_maxrss / 1024.0);
  return 0;
}
