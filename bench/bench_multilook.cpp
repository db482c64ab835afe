// Times the steps of the wide-swath multilook command on one product:
//
//   bench_multilook import PRODUCT ORBIT XCA ROOT
//       extraction of the five sub-swaths and their header conversion
//   bench_multilook multilook ROOT XCA OUTPUT slant|ground [GEOCODED]
//       the multilook as the driver runs it; prints the transform plan; with
//       GEOCODED also the geocoding of its output into that COG, timed on
//       its own ("geocode_seconds") with the peak memory it added
//       ("geocode_peak_rss_mib", over "geocode_start_rss_mib")
//   bench_multilook fft NFFT LOOKLEN LOOKS LINES [NFFT LOOKLEN LOOKS LINES ...]
//       the same transforms alone: per line one forward transform of NFFT
//       and LOOKS inverse transforms of LOOKLEN, lines split on two threads
//
// Each prints "seconds" and "peak_rss_mib".  VELORAN_INIT_DIR must name an
// installation (scripts/make-installation) for the first two.
#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "extraction/images.h"
#include "geocode/geocode_header.h"
#include "multilook/mlook.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"
#include "runtime/suite_state.h"
#include "signal/fft_wrappers.h"

namespace {

double Since(std::chrono::steady_clock::time_point start) {
  return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

void PrintUsage() {
  rusage usage{};
  getrusage(RUSAGE_SELF, &usage);
  std::printf("peak_rss_mib %.1f\n", usage.ru_maxrss / 1024.0);
}

// The suite environment with a working file for the progress reports.
bool Environment(const std::string& root) {
  NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
  init_ckerr_locking();
  init_report(0, "ASAR FOCUSSING", 1);
  const std::string working = root + ".working";
  for (const std::string& f : {working, working + "_batch_ok"}) {
    std::FILE* w = std::fopen(f.c_str(), "w");
    if (w == nullptr) return false;
    std::fclose(w);
  }
  vlr_detail::suite().workingFile = working;
  return true;
}

// A figure of /proc/self/status ("VmRSS", "VmHWM"), MiB.
double StatusMib(const char* key) {
  std::FILE* f = std::fopen("/proc/self/status", "r");
  if (f == nullptr) return -1.0;
  char line[256];
  double kib = -1.0;
  const size_t n = std::strlen(key);
  while (std::fgets(line, sizeof line, f) != nullptr)
    if (std::strncmp(line, key, n) == 0 && line[n] == ':') kib = std::atof(line + n + 1);
  std::fclose(f);
  return kib / 1024.0;
}

// Starts the peak figure of VmHWM afresh (Linux).
void ResetPeak() {
  if (std::FILE* f = std::fopen("/proc/self/clear_refs", "w")) {
    std::fputs("5", f);
    std::fclose(f);
  }
}

int Import(char** argv) {
  if (!Environment(argv[5])) return 2;
  images_conf conf;
  images ex(conf);
  std::snprintf(ex.input.ASA_level1_filename, kImagesNameSize, "%s", argv[2]);
  std::snprintf(ex.input.ASA_dor_vor, kImagesNameSize, "%s", argv[3]);
  std::snprintf(ex.output.OutputFile, kImagesNameSize, "%s", argv[5]);
  const auto start = std::chrono::steady_clock::now();
  if (ex.run() != 0 || tessal2kestova(argv[5], argv[4]) != 0) return 1;
  std::printf("seconds %.3f\n", Since(start));
  PrintUsage();
  return 0;
}

int Multilook(int argc, char** argv) {
  if (!Environment(argv[4])) return 2;
  mlook_conf conf;
  conf.W1 = 0.25;
  conf.W2 = 0.5;
  conf.Sl2Gr = std::strcmp(argv[5], "ground") == 0 ? 1 : 0;
  mlook_input input;
  mlook_output output;
  std::snprintf(input.Level1Filename, kMlookNameSize, "%s", argv[2]);
  std::snprintf(input.ASA_XCA_Filename, kMlookNameSize, "%s", argv[3]);
  std::snprintf(output.OutputFilename, kMlookNameSize, "%s", argv[4]);
  mlook ml(&conf, &input, &output);
  const auto start = std::chrono::steady_clock::now();
  if (ml.readimages_kestova() != 0 || ml.run() != 0 || ml.writepar() != 0) return 1;
  const double seconds = Since(start);
  std::printf("seconds %.3f\nlooks %d\ndecimation %d\nsamples %d\nlines %d\nplan", seconds,
              ml.looks(), ml.decimation(), ml.outputSamples(), ml.outputLines());
  for (int k = 0; k < kMlookSwaths; ++k)
    std::printf(" %d %d %d %lld", ml.fftLength(k), ml.lookLength(k), ml.looks(),
                static_cast<long long>(ml.transformedLines(k)));
  std::printf("\n");
  PrintUsage();
  if (conf.Sl2Gr != 0) {
    // Largest difference, in composite samples, between the range times the
    // ground-range resampling used and the exact solution, on every third
    // line.
    double worst = 0.0;
    const double composite = ml.decimation() / ml.fs;
    for (int line = 0; line < ml.outputLines(); line += 3)
      for (int column = 0; column < ml.outputSamples(); ++column) {
        double az = 0.0, exact = 0.0, used = 0.0;
        if (ml.outputPixelTimes(column, line, &az, &exact) != 0 ||
            ml.resampledRangeTime(column, line, &used) != 0)
          continue;
        worst = std::max(worst, std::fabs(used - exact) / composite);
      }
    std::printf("resampling_error %.5f\n", worst);
  }
  if (argc > 6) {
    MlookRadarGrid grid;
    GeneralSAROrbit orbit;
    if (ml.radarGrid(&grid) != 0 || ml.orbit()->clone(&orbit) != 0) return 1;
    ml.freeimages();
    ResetPeak();
    const double startRss = StatusMib("VmRSS");
    std::string message;
    GeocodeFigures figures;
    MapGrid map;
    const auto geocodeStart = std::chrono::steady_clock::now();
    if (GeocodeMultilook(argv[4], grid, orbit, GeocodeOptions(), conf.GrSamplingStep, argv[6],
                         &message, &map, &figures) != 0) {
      std::fprintf(stderr, "%s\n", message.c_str());
      return 1;
    }
    std::printf(
        "geocode_seconds %.3f\ngeocode_map %d %d\ngeocode_exact %d\ngeocode_cog_seconds %.3f\n",
        Since(geocodeStart), map.width, map.height, figures.exactSolutions, figures.cogSeconds);
    std::printf("geocode_start_rss_mib %.1f\ngeocode_peak_rss_mib %.1f\n", startRss,
                StatusMib("VmHWM"));
    return 0;
  }
  ml.freeimages();
  return 0;
}

int Transforms(int argc, char** argv) {
  init_ckerr_locking();
  init_report(0, "ASAR FOCUSSING", 1);
  double seconds = 0.0;
  for (int a = 2; a + 3 < argc; a += 4) {
    const int nfft = std::atoi(argv[a]), m = std::atoi(argv[a + 1]), looks = std::atoi(argv[a + 2]);
    const long long lines = std::atoll(argv[a + 3]);
    fft_plan_c forward, inverse;
    if (fft_makep_c(&forward, nfft, nfft, 1, 1, FftDirection::kForward, FftDirection::kNone, 1) !=
            0 ||
        fft_makep_c(&inverse, m, m, 1, 1, FftDirection::kBackward, FftDirection::kNone, 1) != 0)
      return 1;
    std::vector<fcomplex> rows[2], look[2];
    for (int t = 0; t < 2; ++t) {
      rows[t].assign(static_cast<size_t>(nfft), fcomplex(1.0f, -1.0f));
      look[t].assign(static_cast<size_t>(m), fcomplex(0.5f, 0.25f));
    }
    auto work = [&](int t, long long count) {
      for (long long i = 0; i < count; ++i) {
        pfft_c(&forward, rows[t].data(), rows[t].data());
        for (int l = 0; l < looks; ++l) pfft_c(&inverse, look[t].data(), look[t].data());
      }
    };
    const auto start = std::chrono::steady_clock::now();
    std::thread other(work, 1, lines / 2);
    work(0, lines - lines / 2);
    other.join();
    seconds += Since(start);
  }
  std::printf("seconds %.3f\n", seconds);
  PrintUsage();
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  const std::string mode = argc > 1 ? argv[1] : "";
  if (mode == "import" && argc == 6) return Import(argv);
  if (mode == "multilook" && (argc == 6 || argc == 7)) return Multilook(argc, argv);
  if (mode == "fft" && argc >= 6) return Transforms(argc, argv);
  std::fprintf(stderr,
               "usage: %s import PRODUCT ORBIT XCA ROOT | multilook ROOT XCA OUTPUT slant|ground "
               "[GEOCODED] "
               "| fft NFFT LOOKLEN LOOKS LINES ...\n",
               argv[0]);
  return 2;
}
