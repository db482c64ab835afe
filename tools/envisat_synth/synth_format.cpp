#include "synth_format.h"

#include <cmath>
#include <cstdio>
#include <cstring>
#include <stdexcept>

namespace synth {
namespace {

// Appends KEY=value lines and checks that values start where readers look.
class HeaderText {
 public:
  void line(const std::string& key, const std::string& value, int value_offset) {
    text_ += key + "=";
    check(value_offset);
    text_ += value + "\n";
  }
  void quoted(const std::string& key, const std::string& value, size_t width, int value_offset) {
    std::string v = value.substr(0, width);
    v.resize(width, ' ');
    line(key, "\"" + v + "\"", value_offset - 1);
  }
  void spare(int blanks) { text_ += std::string(blanks, ' ') + "\n"; }
  void pad_to(size_t size) {
    if (text_.size() > size) throw std::logic_error("header block overflow");
    text_.resize(size, ' ');
  }
  const std::string& str() const { return text_; }

 private:
  void check(int value_offset) {
    if (value_offset >= 0 && static_cast<int>(text_.size()) != value_offset)
      throw std::logic_error("header value misplaced at " + std::to_string(text_.size()) +
                             ", expected " + std::to_string(value_offset));
  }
  std::string text_;
};

std::string num(const char* fmt, double v) {
  char buf[64];
  std::snprintf(buf, sizeof buf, fmt, v);
  return buf;
}
std::string inum(const char* fmt, long long v) {
  char buf[64];
  std::snprintf(buf, sizeof buf, fmt, v);
  return buf;
}

}  // namespace

void put_u8(std::vector<uint8_t>& b, size_t off, int v) {
  b.at(off) = static_cast<uint8_t>(v);
}
void put_u32(std::vector<uint8_t>& b, size_t off, uint32_t v) {
  b.at(off + 3);
  for (int i = 0; i < 4; ++i) b[off + i] = static_cast<uint8_t>(v >> (24 - 8 * i));
}
void put_i16(std::vector<uint8_t>& b, size_t off, int16_t v) {
  const uint16_t u = static_cast<uint16_t>(v);
  b.at(off + 1);
  b[off] = static_cast<uint8_t>(u >> 8);
  b[off + 1] = static_cast<uint8_t>(u);
}
void put_i32(std::vector<uint8_t>& b, size_t off, int32_t v) {
  put_u32(b, off, static_cast<uint32_t>(v));
}
void put_f32(std::vector<uint8_t>& b, size_t off, float v) {
  uint32_t u;
  std::memcpy(&u, &v, 4);
  put_u32(b, off, u);
}
void put_f64(std::vector<uint8_t>& b, size_t off, double v) {
  uint64_t u;
  std::memcpy(&u, &v, 8);
  put_u32(b, off, static_cast<uint32_t>(u >> 32));
  put_u32(b, off + 4, static_cast<uint32_t>(u));
}
void put_mjd(std::vector<uint8_t>& b, size_t off, double t85) {
  const Mjd m = to_mjd(t85);
  put_i32(b, off, m.days);
  put_u32(b, off + 4, m.seconds);
  put_u32(b, off + 8, m.microseconds);
}
void put_text(std::vector<uint8_t>& b, size_t off, const std::string& s) {
  b.at(off + s.size() - 1);
  std::memcpy(&b[off], s.data(), s.size());
}

std::string build_mph(const MphValues& v) {
  HeaderText h;
  h.quoted("PRODUCT", v.product, 62, 9);
  h.line("PROC_STAGE", std::string(1, v.proc_stage), 84);
  h.quoted("REF_DOC", v.ref_doc, 23, 95);
  h.spare(40);
  h.quoted("ACQUISITION_STATION", v.station, 20, 182);
  h.quoted("PROC_CENTER", v.proc_center, 6, 217);
  h.quoted("PROC_TIME", format_utc(v.proc_time), 27, 236);
  h.quoted("SOFTWARE_VER", v.software, 14, 279);
  h.spare(40);
  h.quoted("SENSING_START", format_utc(v.sensing_start), 27, 351);
  h.quoted("SENSING_STOP", format_utc(v.sensing_stop), 27, 394);
  h.spare(40);
  h.line("PHASE", std::string(1, v.phase), 470);
  h.line("CYCLE", inum("%+04lld", v.cycle), 478);
  h.line("REL_ORBIT", inum("%+06lld", v.rel_orbit), 493);
  h.line("ABS_ORBIT", inum("%+06lld", v.abs_orbit), 510);
  h.quoted("STATE_VECTOR_TIME", v.has_state ? format_utc(v.sv_time) : std::string(), 27, 536);
  h.line("DELTA_UT1", "+.000000<s>", 575);
  const char* axes[3] = {"X", "Y", "Z"};
  const int pos_off[3] = {598, 625, 652}, vel_off[3] = {679, 708, 737};
  for (int i = 0; i < 3; ++i)
    h.line(std::string(axes[i]) + "_POSITION", num("%+012.3f", v.pos[i]) + "<m>", pos_off[i]);
  for (int i = 0; i < 3; ++i)
    h.line(std::string(axes[i]) + "_VELOCITY", num("%+012.6f", v.vel[i]) + "<m/s>", vel_off[i]);
  h.quoted("VECTOR_SOURCE", v.has_state ? "FP" : "  ", 2, 770);
  h.spare(40);
  h.quoted("UTC_SBT_TIME", format_utc(v.sensing_start), 27, 829);
  h.line("SAT_BINARY_TIME", "+0000000000", 874);
  h.line("CLOCK_STEP", "+3906250000<ps>", 897);
  h.spare(32);
  h.quoted("LEAP_UTC", "", 27, 956);
  h.line("LEAP_SIGN", "+000", 995);
  h.line("LEAP_ERR", "0", 1009);
  h.spare(40);
  h.line("PRODUCT_ERR", "0", 1064);
  h.line("TOT_SIZE", inum("%+021lld", v.tot_size) + "<bytes>", 1075);
  h.line("SPH_SIZE", inum("%+011lld", v.sph_size) + "<bytes>", 1113);
  h.line("NUM_DSD", inum("%+011lld", v.num_dsd), 1140);
  h.line("DSD_SIZE", inum("%+011lld", kDsdSize) + "<bytes>", 1161);
  h.line("NUM_DATA_SETS", inum("%+011lld", v.num_data_sets), 1194);
  h.spare(40);
  if (h.str().size() != kMphSize) throw std::logic_error("MPH size");
  return h.str();
}

std::string build_dsd(const DsdValues& v) {
  HeaderText h;
  h.quoted("DS_NAME", v.name, 28, 9);
  h.line("DS_TYPE", std::string(1, v.type), 47);
  h.quoted("FILENAME", v.filename, 62, 59);
  h.line("DS_OFFSET", inum("%+021lld", v.offset) + "<bytes>", 133);
  h.line("DS_SIZE", inum("%+021lld", v.size) + "<bytes>", 170);
  h.line("NUM_DSR", inum("%+011lld", v.num_dsr), 207);
  h.line("DSR_SIZE", inum("%+011lld", v.dsr_size) + "<bytes>", 228);
  h.spare(32);
  if (h.str().size() != kDsdSize) throw std::logic_error("DSD size");
  return h.str();
}

std::string build_image_sph(const ImageSphValues& v) {
  HeaderText h;
  h.quoted("SPH_DESCRIPTOR", v.descriptor, 28, 16);
  h.line("STRIPLINE_CONTINUITY_INDICATOR", "+000", 77);
  h.line("SLICE_POSITION", "+001", 97);
  h.line("NUM_SLICES", "+001", 113);
  h.quoted("FIRST_LINE_TIME", format_utc(v.first_line), 27, 135);
  h.quoted("LAST_LINE_TIME", format_utc(v.last_line), 27, 180);
  const char* keys[6] = {"FIRST_NEAR", "FIRST_MID", "FIRST_FAR",
                         "LAST_NEAR",  "LAST_MID",  "LAST_FAR"};
  const int lat_off[6] = {224, 298, 371, 444, 516, 587};
  for (int i = 0; i < 6; ++i) {
    const long long lat = std::llround(v.corner_lat[i] * 1e6);
    const long long lon = std::llround(v.corner_lon[i] * 1e6);
    h.line(std::string(keys[i]) + "_LAT", inum("%+011lld", lat) + "<10-6degN>", lat_off[i]);
    h.line(std::string(keys[i]) + "_LONG", inum("%+011lld", lon) + "<10-6degE>", -1);
  }
  h.spare(35);
  h.quoted("SWATH", v.swath, 3, 688);
  h.quoted("PASS", v.pass, 10, 699);
  h.quoted("SAMPLE_TYPE", v.sample_type, 8, 724);
  h.quoted("ALGORITHM", v.algorithm, 7, 745);
  h.quoted("MDS1_TX_RX_POLAR", v.polar1, 3, 772);
  h.quoted("MDS2_TX_RX_POLAR", v.polar2, 3, 795);
  h.quoted("COMPRESSION", "NONE", 5, 813);
  h.line("AZIMUTH_LOOKS", "+001", 834);
  h.line("RANGE_LOOKS", "+001", 851);
  h.line("RANGE_SPACING", num("%+.8e", v.range_spacing) + "<m>", 870);
  h.line("AZIMUTH_SPACING", num("%+.8e", v.azimuth_spacing) + "<m>", 905);
  h.line("LINE_TIME_INTERVAL", num("%+.8e", v.line_interval) + "<s>", 943);
  h.line("LINE_LENGTH", inum("%+06lld", v.line_length) + "<samples>", 974);
  h.quoted("DATA_TYPE", v.data_type, 5, 1001);
  h.spare(50);
  if (h.str().size() != 1059) throw std::logic_error("SPH size");
  return h.str();
}

std::string build_aux_sph(const std::string& descriptor, const DsdValues& dsd) {
  HeaderText h;
  h.quoted("SPH_DESCRIPTOR", descriptor, 28, 16);
  h.spare(51);
  std::string s = h.str() + build_dsd(dsd);
  if (s.size() != kAuxSphSize) throw std::logic_error("auxiliary SPH size");
  return s;
}

std::string doris_record(double t85, double delta_ut1, int abs_orbit, const double pos[3],
                         const double vel[3]) {
  char ut1[16];
  std::snprintf(ut1, sizeof ut1, "%+.6f", delta_ut1);  // "-0.331385" -> "-.331385"
  std::string u = ut1;
  if (u.size() > 2 && u[1] == '0') u.erase(1, 1);
  char buf[160];
  std::snprintf(buf, sizeof buf,
                "%s %s %+06d %+012.3f %+012.3f %+012.3f %+012.6f %+012.6f %+012.6f      3\n",
                format_utc(t85).c_str(), u.c_str(), abs_orbit, pos[0], pos[1], pos[2], vel[0],
                vel[1], vel[2]);
  std::string r = buf;
  if (r.size() != 129) throw std::logic_error("DORIS record size");
  return r;
}

}  // namespace synth
