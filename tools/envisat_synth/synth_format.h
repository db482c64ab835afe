// ENVISAT header texts and big-endian record fields as the generator writes
// them.  Header lines are assembled key by key; every value lands at the
// fixed offset that readers take it from (checked when the block is built).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "synth_time.h"

namespace synth {

constexpr int kMphSize = 1247;
constexpr int kDsdSize = 280;
constexpr int kWssSphSize = 1059 + 18 * kDsdSize;  // 6099
constexpr int kAuxSphSize = 378;                   // one DSD after a 98-byte SPH
constexpr int kAuxDataOffset = kMphSize + kAuxSphSize;

// Big-endian stores into a record buffer.
void put_u8(std::vector<uint8_t>& b, size_t off, int v);
void put_i16(std::vector<uint8_t>& b, size_t off, int16_t v);
void put_u32(std::vector<uint8_t>& b, size_t off, uint32_t v);
void put_i32(std::vector<uint8_t>& b, size_t off, int32_t v);
void put_f32(std::vector<uint8_t>& b, size_t off, float v);
void put_f64(std::vector<uint8_t>& b, size_t off, double v);
void put_mjd(std::vector<uint8_t>& b, size_t off, double t85);
void put_text(std::vector<uint8_t>& b, size_t off, const std::string& s);

// Values of the main product header that differ between files.
struct MphValues {
  std::string product;  // file name, at most 62 characters
  char proc_stage = 'N';
  std::string ref_doc = "PO-RS-MDA-GS-2009_4/B";
  std::string station = "PDHS-K";
  std::string proc_center = "PDHS-K";
  double proc_time = 0;
  std::string software = "ASAR/4.05";
  double sensing_start = 0, sensing_stop = 0;
  char phase = '2';
  int cycle = 0, rel_orbit = 0, abs_orbit = 0;
  double sv_time = 0;
  bool has_state = false;
  double pos[3] = {0, 0, 0}, vel[3] = {0, 0, 0};
  int64_t tot_size = 0;
  int sph_size = 0, num_dsd = 0, num_data_sets = 0;
};
std::string build_mph(const MphValues& v);

struct DsdValues {
  std::string name;  // at most 28 characters
  char type = 'A';
  std::string filename;
  int64_t offset = 0, size = 0;
  int64_t num_dsr = 0, dsr_size = 0;
};
std::string build_dsd(const DsdValues& v);

// Specific header of an image product, without its DSDs (1059 bytes).
struct ImageSphValues {
  std::string descriptor = "Wide Swath SLC Image";
  double first_line = 0, last_line = 0;
  double corner_lat[6] = {0}, corner_lon[6] = {0};  // first near/mid/far, last near/mid/far
  std::string swath = "WS ", pass, sample_type = "COMPLEX ", algorithm = "SPECAN ";
  std::string polar1, polar2 = "   ";
  double range_spacing = 0, azimuth_spacing = 0, line_interval = 0;
  int line_length = 0;
  std::string data_type = "SWORD";
};
std::string build_image_sph(const ImageSphValues& v);

// Specific header of an auxiliary or orbit file: descriptor, spare, one DSD.
std::string build_aux_sph(const std::string& descriptor, const DsdValues& dsd);

// "+6494931.106"-style orbit numbers and the 129-byte DORIS record.
std::string doris_record(double t85, double delta_ut1, int abs_orbit, const double pos[3],
                         const double vel[3]);

}  // namespace synth
