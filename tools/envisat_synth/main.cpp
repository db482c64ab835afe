// envisat_synth: writes a synthetic ENVISAT ASAR SLC product (wide swath,
// image mode or alternating polarisation) with its orbit and auxiliary
// files, and the ground truth a reader must find.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "synth_scene.h"
#include "synth_writer.h"

#ifndef SYNTH_DEFAULT_ORBIT
#define SYNTH_DEFAULT_ORBIT ""
#endif

namespace {

const char* kHelp =
    "usage: envisat_synth --out DIR [options]\n"
    "\n"
    "Writes into DIR an ASAR SLC product (by default ASA_WSS_1P, five sub-swaths of\n"
    "ScanSAR bursts), the DORIS orbit file it follows, an ASA_XCA and an ASA_INS file\n"
    "valid at the scene time, ASA_AUX_list.dat listing them, and synth_truth.txt.\n"
    "Same options and seed give byte-identical files.\n"
    "\n"
    "options:\n"
    "  --product P          WSS | IMS | APS (default WSS)\n"
    "                         WSS: wide-swath SLC, five sub-swaths of bursts\n"
    "                         IMS: image-mode SLC of swath IS2, one image (MDS1)\n"
    "                         APS: alternating-polarisation SLC of swath IS2, two\n"
    "                         images of the same lines (MDS1 co-, MDS2 cross-polarised)\n"
    "                       IMS and APS use the image-mode descriptor layout and\n"
    "                       lines one pulse repetition interval apart\n"
    "  --seed N             speckle seed (default 1)\n"
    "  --size S             tiny | small | realistic (default tiny)\n"
    "                         tiny: 4 bursts, 104 to 136 samples per sub-swath (< 1 MB);\n"
    "                         IMS/APS 232 samples x 320 lines per image\n"
    "                         small: 30 bursts, 272 to 352 samples per sub-swath;\n"
    "                         IMS/APS 480 samples x 960 lines\n"
    "                         realistic: 282 bursts (60 s), real sample counts (~1.7 GB);\n"
    "                         IMS/APS 5174 samples x 26000 lines (~16 s, ~540 MB each)\n"
    "  --start TEXT         sensing start, \"DD-MMM-YYYY HH:MM:SS[.ffffff]\"; default: the\n"
    "                       first crossing of 45 degrees latitude on the requested pass\n"
    "                       at least 2 h into the orbit file (02-MAR-2008 10:00:00 with\n"
    "                       --orbit kepler)\n"
    "  --polarisation P     HH | VV (default HH); APS: the co-polarised image, the\n"
    "                       second is HV or VH\n"
    "  --pass P             ascending | descending (default descending)\n"
    "  --orbit FILE|kepler  DORIS file whose trajectory the scene follows (the scene must\n"
    "                       lie inside its validity; it is copied into DIR), or a\n"
    "                       circular Keplerian orbit written as a DOR_VOR file with 60 s\n"
    "                       records from 2 h before to 1 h after the scene.\n"
    "                       default: " SYNTH_DEFAULT_ORBIT
    "\n"
    "  --pattern P          flat | checkerboard | points | uniform (default checkerboard);\n"
    "                       uniform: every sample the same expected power (no burst taper)\n"
    "  --band-limit         range spectrum of every line limited to the sub-swath's chirp\n"
    "                       bandwidth (exact for the flat and uniform patterns)\n"
    "  --bursts N           WSS: N bursts per sub-swath instead of those of the size\n"
    "                       (a longer or shorter scene of the same width)\n"
    "  --first-tie-sample N sample number of the first tie point of the geolocation grid\n"
    "                       (default 1)\n"
    "defects:\n"
    "  --blank-start N      first N records of every MDS blank (quality -1, zero samples);\n"
    "                       also --blank-first\n"
    "  --blank-end N        last N records likewise; also --blank-last\n"
    "  --blank-zero-time    blank records carry zero time fields\n"
    "  --mds-count N        WSS only: write only N measurement data sets (the other\n"
    "                       DSDs empty; 4 leaves the fifth MDS descriptor with size 0)\n"
    "  --truncate BYTES     cut the product after BYTES bytes\n"
    "  --dsd-beyond-end K   DSD K (0..17) points 4096 bytes beyond the end of the file\n"
    "  --zero-count K       annotation DSD K with record count and size 0 (WSS 0..6:\n"
    "                       1 main parameters, 5 geolocation; IMS/APS 0..9: 2 main\n"
    "                       parameters, 3 Doppler, 8 geolocation)\n"
    "  --wrong-type CODE    product name (and file name) starts with CODE, e.g. ASA_IMS_1P\n"
    "\n"
    "synth_truth.txt is a parameter file ([Section], Key = value), its keys described\n"
    "in tools/envisat_synth/synth_truth.cpp:\n"
    "  [Scene]        file names, product type, orbit source, sensing start/stop, pass,\n"
    "                 polarisation, orbits, line interval, burst cycle, rates, corners\n"
    "  [SubSwath1..5] Samples, Records, LinesPerBurst, Bursts, EchoesPerBurst, Rank, PRF,\n"
    "                 BurstCycle, First/LastLineTime, Near/FarRangeTime, look bandwidth,\n"
    "                 windows, chirp power, Doppler and FM-rate polynomials, corners ...\n"
    "  [Image1..2]    IMS/APS instead: the same without burst values, with Polarisation\n"
    "                 and Swath\n"
    "  [Pattern]      reflectivity pattern R(daz, drg) and how samples were drawn from it\n"
    "  [Doppler], [Calibration], [Defects]\n"
    "Times are seconds since 01-JAN-1985 (with UTC texts), range times two-way seconds,\n"
    "angles and coordinates degrees.\n";

bool take_int(const char* v, long long* out) {
  char* end = nullptr;
  *out = std::strtoll(v, &end, 10);
  return end != v && *end == '\0';
}

}  // namespace

int main(int argc, char** argv) {
  synth::Options o;
  o.orbit = SYNTH_DEFAULT_ORBIT;
  for (int i = 1; i < argc; ++i) {
    const std::string a = argv[i];
    if (a == "--help" || a == "-h") {
      std::fputs(kHelp, stdout);
      return 0;
    }
    if (a == "--band-limit") {
      o.band_limit = true;
      continue;
    }
    if (a == "--blank-zero-time") {
      o.blank_zero_time = true;
      continue;
    }
    if (i + 1 >= argc) {
      std::fprintf(stderr, "envisat_synth: %s needs a value (see --help)\n", a.c_str());
      return 2;
    }
    const char* v = argv[++i];
    long long n = 0;
    bool ok = true;
    if (a == "--out")
      o.out_dir = v;
    else if (a == "--product")
      o.product = v;
    else if (a == "--size")
      o.size = v;
    else if (a == "--start")
      o.start = v;
    else if (a == "--polarisation")
      o.polarisation = v;
    else if (a == "--pass")
      o.pass = v;
    else if (a == "--orbit")
      o.orbit = v;
    else if (a == "--pattern")
      o.pattern = v;
    else if (a == "--wrong-type")
      o.wrong_type = v;
    else if ((ok = take_int(v, &n))) {
      if (a == "--seed" && n >= 0)
        o.seed = static_cast<uint64_t>(n);
      else if ((a == "--blank-start" || a == "--blank-first") && n >= 0 && n <= 10000000)
        o.blank_first = static_cast<int>(n);
      else if ((a == "--blank-end" || a == "--blank-last") && n >= 0 && n <= 10000000)
        o.blank_last = static_cast<int>(n);
      else if (a == "--bursts" && n >= 1 && n <= 5000)
        o.bursts = static_cast<int>(n);
      else if (a == "--first-tie-sample" && n >= 1 && n <= 100000)
        o.first_tie_sample = static_cast<int>(n);
      else if (a == "--mds-count" && n >= 0 && n <= 5)
        o.mds_count = static_cast<int>(n);
      else if (a == "--truncate" && n >= 0)
        o.truncate_at = n;
      else if (a == "--dsd-beyond-end" && n >= 0 && n < 18)
        o.dsd_beyond_end = static_cast<int>(n);
      else if (a == "--zero-count" && n >= 0 && n <= 9)
        o.zero_count = static_cast<int>(n);
      else
        ok = false;
    }
    if (!ok) {
      std::fprintf(stderr, "envisat_synth: bad option or value: %s %s (see --help)\n", a.c_str(),
                   v);
      return 2;
    }
  }
  if (o.out_dir.empty()) {
    std::fputs("envisat_synth: --out DIR is required (see --help)\n", stderr);
    return 2;
  }
  if (o.orbit.empty()) {
    std::fputs("envisat_synth: no default orbit file known; give --orbit FILE or kepler\n", stderr);
    return 2;
  }
  std::error_code ec;
  std::filesystem::create_directories(o.out_dir, ec);
  if (ec) {
    std::fprintf(stderr, "envisat_synth: cannot create %s: %s\n", o.out_dir.c_str(),
                 ec.message().c_str());
    return 1;
  }
  const auto t_start = std::chrono::steady_clock::now();
  synth::Scene scene;
  std::string error;
  if (!synth::build_scene(o, &scene, &error) || !synth::write_scene(scene, &error)) {
    std::fprintf(stderr, "envisat_synth: %s\n", error.c_str());
    return 1;
  }
  const double secs =
      std::chrono::duration<double>(std::chrono::steady_clock::now() - t_start).count();
  std::printf("%s written in %.1f s\n", scene.product_name.c_str(), secs);
  return 0;
}
