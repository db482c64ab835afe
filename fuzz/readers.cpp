// libFuzzer targets for every reader of files this tool does not write.
// One source, one target per binary: VLR_FUZZ_TARGET names the reader.
// Each input is written to a private temporary folder, read, and every
// process-wide state the readers keep (profile cache, report and
// allocation tables, orbit window) is checked or reset before the next.
#include <dirent.h>
#include <stdlib.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "cli/cli_options.h"
#include "drivers/driver_arguments.h"
#include "envisat/product_header.h"
#include "extraction/images.h"
#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/sensor_attitude.h"
#include "orbit/doris_record.h"
#include "orbit/interp_orb_l.h"
#include "orbit/orbit_window.h"
#include "profile/profile_cache.h"
#include "profile/profile_values.h"
#include "runtime/ckerr.h"
#include "runtime/list_file.h"
#include "runtime/raise.h"
#include "runtime/suite_state.h"
#include "suite/description_header.h"
#include "suite/description_section.h"

namespace {

std::string& Dir() {
  static std::string dir;
  return dir;
}

std::string Write(const char* name, const uint8_t* data, size_t size) {
  const std::string path = Dir() + name;
  std::FILE* f = std::fopen(path.c_str(), "wb");
  if (f == nullptr) std::abort();
  if (size > 0 && std::fwrite(data, 1, size, f) != size) std::abort();
  std::fclose(f);
  return path;
}

// Empties and removes the temporary folder (it holds files only).
void RemoveDir() {
  if (Dir().empty()) return;
  if (DIR* d = opendir(Dir().c_str())) {
    while (const dirent* e = readdir(d)) {
      if (e->d_name[0] != '.') unlink((Dir() + e->d_name).c_str());
    }
    closedir(d);
  }
  rmdir(Dir().c_str());
}

// Runs a reader; a raised suite error is an answer like any result code.
template <typename F>
void Guarded(F&& read) {
  try {
    read();
  } catch (const CErrorExceptionManager&) {
  }
}

#if defined(VLR_FUZZ_EXTRACTION)
std::vector<uint8_t> Slurp(const std::string& path) {
  std::vector<uint8_t> bytes;
  if (std::FILE* f = std::fopen(path.c_str(), "rb")) {
    uint8_t buf[65536];
    size_t n;
    while ((n = std::fread(buf, 1, sizeof buf, f)) > 0) bytes.insert(bytes.end(), buf, buf + n);
    std::fclose(f);
  }
  return bytes;
}

// The generated product whose annotation data sets take the fuzzer's bytes.
struct Product {
  std::string dir;         // generator output (VLR_FUZZ_PRODUCT_DIR)
  std::string orbit, ins;  // its DORIS and INS files
  std::vector<uint8_t> bytes;
  std::vector<EnvisatDataSet> annotation;
};
Product& TheProduct() {
  static Product p;
  return p;
}
// The first file of `dir` whose name starts with `prefix`, or "".
std::string FindIn(const std::string& dir, const char* prefix) {
  std::string found;
  if (DIR* d = opendir(dir.c_str())) {
    while (const dirent* e = readdir(d)) {
      if (std::strncmp(e->d_name, prefix, std::strlen(prefix)) == 0) {
        found = dir + "/" + e->d_name;
        break;
      }
    }
    closedir(d);
  }
  return found;
}
#endif

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  // Memory-backed when the system has it: the extraction writes a product
  // and its outputs for every input.
  char shm[] = "/dev/shm/vlr_fuzz_XXXXXX";
  char tmp[] = "/tmp/vlr_fuzz_XXXXXX";
  const char* pattern = mkdtemp(shm) != nullptr ? shm : mkdtemp(tmp);
  if (pattern == nullptr) std::abort();
  Dir() = std::string(pattern) + "/";
  std::atexit(RemoveDir);
  // Error and report files of the suite land in the temporary folder.
  if (chdir(pattern) != 0) std::abort();
  setenv("VELORAN_WORKING_DIR", Dir().c_str(), 1);
  setenv("VELORAN_BATCH_DIR", Dir().c_str(), 1);
  vlr_detail::suite().loggingMode = false;
  set_flg_report(0);
#if defined(VLR_FUZZ_EXTRACTION)
  Product& p = TheProduct();
  const char* dir = std::getenv("VLR_FUZZ_PRODUCT_DIR");
  if (dir == nullptr) {
    std::fprintf(stderr, "VLR_FUZZ_PRODUCT_DIR must name a generated wide-swath product\n");
    std::abort();
  }
  p.dir = dir;
  p.orbit = FindIn(p.dir, "DOR_");
  p.ins = FindIn(p.dir, "ASA_INS");
  p.bytes = Slurp(FindIn(p.dir, "ASA_WSS"));
  EnvisatHeaders h;
  if (p.bytes.empty() || read_envisat_headers(FindIn(p.dir, "ASA_WSS").c_str(), &h) != 0)
    std::abort();
  const EnvisatDsdLayout& l = h.layout();
  for (size_t at : {l.mainProcessing, l.doppler, l.chirp, l.antenna, l.geolocation})
    p.annotation.push_back(h.dataSet(at));
  const std::string working = Dir() + "Process.working";
  const uint8_t start[] = "0\nStarting\n";
  Write("Process.working", start, sizeof start - 1);
  Write("Process.working_batch_ok", start, 0);
  vlr_detail::suite().workingFile = working;
#endif
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
#if defined(VLR_FUZZ_HEADERS)
  // Main and specific product headers and their data set descriptors.
  const std::string path = Write("product.N1", data, size);
  EnvisatHeaders h;
  if (read_envisat_headers(path.c_str(), &h) == 0) {
    EnvisatDataSet sets[5];
    const int n = h.imageDataSets(sets);
    for (int i = 0; i < n; ++i) (void)sets[i].fitsIn(h.fileSize);
  }
#elif defined(VLR_FUZZ_DORIS)
  // DORIS orbit files: vectors around a time inside the file's sensing span
  // when its header states one, else at an arbitrary time.
  const std::string path = Write("DOR_VOR_AX", data, size);
  double start = 7.0e8;
  if (size >= kMphSize)
    parse_doris_time(reinterpret_cast<const char*>(data) + kMphSensingStart.offset,
                     kMphSensingStart.width, &start);
  double pos[15], vel[15], anx = 0.0;
  int orbit = 0;
  for (int wantAnx : {0, 1})
    (void)interp_orb_l(path.c_str(), start + 30.0, 5, 5.0, pos, vel, &orbit, wantAnx, &anx);
#elif defined(VLR_FUZZ_AUX)
  // XCA (antenna patterns) and INS (droop gains) auxiliary files.
  const std::string path = Write("ASA_AUX", data, size);
  const int pick = size > 0 ? data[size - 1] : 0;
  Guarded([&] {
    AntennaPattern_Obj pattern;
    (void)pattern.getPatternENVI(path.c_str(), pick % 2, (pick / 2) % 7);
  });
  Guarded([&] {
    SensorAttitude_Obj attitude;
    (void)attitude.getDroopGain(path.c_str(), pick % 8);
  });
#elif defined(VLR_FUZZ_PROFILE)
  // Parameter files through the profile cache.
  const std::string path = Write("params.hdr", data, size);
  char text[256];
  double values[8];
  char* strings[2];
  char s0[32], s1[32];
  strings[0] = s0;
  strings[1] = s1;
  for (const char* section : {"GeneralProcessingConf", "ImportEsa", ""}) {
    (void)GetMyProfileString(section, "ReportLevel", text, sizeof text, path.c_str());
    (void)GetProfileDoubleArray(section, "Values", values, 8, path.c_str());
    (void)GetMyProfileStringArray(section, "Names", strings, 2, 32, path.c_str());
  }
  FreeProfile(path.c_str());
#elif defined(VLR_FUZZ_SML) || defined(VLR_FUZZ_TEXT_HEADER)
  // Suite headers, ".sml" and "_hdr", into sections defined from the
  // installation's key files.
#if defined(VLR_FUZZ_SML)
  const std::string path = Write("header.sml", data, size);
#else
  const std::string path = Write("header_hdr", data, size);
#endif
  Guarded([&] {
    CDescriptionHeader header;
    for (const char* name : {"RasterInfo", "state", "hemisphere", "zone", "StateVectorData"})
      header.addSection(name)->defineFromKeyFile(std::string(VLR_KEY_DIR) + name + ".key");
#if defined(VLR_FUZZ_SML)
    (void)readXmlHeaderFile(header, path.c_str());
#else
    (void)readTextHeaderFile(header, path.c_str());
#endif
    (void)header.dumpText();
  });
#elif defined(VLR_FUZZ_KEY_FILE)
  // Section key files.
  const std::string path = Write("section.key", data, size);
  Guarded([&] {
    CDescriptionSection section("RasterInfo");
    section.defineFromKeyFile(path);
  });
#elif defined(VLR_FUZZ_ARGUMENTS)
  // The argument list file the host hands over, and its words as a
  // command line.
  const std::string path = Write("arguments.txt", data, size);
  const std::string text = " " + path + "###Veloran###";
  Guarded([&] { (void)vlr::ReadDriverArguments(text.c_str(), "fuzz", "fuzz"); });
  Guarded([&] {
    const std::vector<std::string> words = NVLR_UTILITY_ReadListFile(path.c_str());
    std::vector<const char*> argv{"import_wss"};
    for (const std::string& w : words) argv.push_back(w.c_str());
    vlr::cli::Options options;
    std::string error;
    (void)vlr::cli::ParseCommandLine(static_cast<int>(argv.size()), argv.data(), options, error);
  });
#elif defined(VLR_FUZZ_EXTRACTION)
  // The extraction of a small wide-swath product whose annotation data sets
  // (main processing parameters, Doppler, chirp, antenna, geolocation) hold
  // the fuzzer's bytes in that order.
  const Product& p = TheProduct();
  std::vector<uint8_t> product = p.bytes;
  size_t used = 0;
  for (const EnvisatDataSet& ds : p.annotation) {
    if (!ds.present() || used >= size) break;
    const size_t n = std::min(static_cast<size_t>(ds.size), size - used);
    std::memcpy(product.data() + ds.offset, data + used, n);
    used += n;
  }
  const std::string path = Write("ASA_WSS_1P.N1", product.data(), product.size());
  images_conf conf;
  conf.Verbose = 0;
  images ex(conf);
  std::snprintf(ex.input.ASA_level1_filename, kImagesNameSize, "%s", path.c_str());
  std::snprintf(ex.input.ASA_dor_vor, kImagesNameSize, "%s", p.orbit.c_str());
  std::snprintf(ex.input.ASA_INS_Filename, kImagesNameSize, "%s", p.ins.c_str());
  std::snprintf(ex.output.OutputFile, kImagesNameSize, "%sR", Dir().c_str());
  Guarded([&] { (void)ex.run(); });
  // Whatever the run left of its outputs ("R..." files) goes before the next.
  while (true) {
    const std::string left = FindIn(Dir().substr(0, Dir().size() - 1), "R");
    if (left.empty() || unlink(left.c_str()) != 0) break;
  }
#else
#error "VLR_FUZZ_<TARGET> names the reader"
#endif
  // Every input starts with an empty orbit window and reports off, as the
  // first did.
  (void)read_SVs(0, 0, nullptr, 0);
  set_flg_report(0);
  // A reader leaves no tracked buffer and no open call scope behind.
  if (ckerr_count() != 0 || ckerr_depth() != 0) {
    std::fprintf(stderr, "reader left %d tracked buffers, call depth %d\n", ckerr_count(),
                 ckerr_depth());
    std::abort();
  }
  return 0;
}
