#include "synth_writer.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <complex>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <vector>

#include "synth_format.h"
#include "synth_spectrum.h"

namespace synth {
namespace {

constexpr int kSqSize = 170, kMppSize = 2009, kDopSize = 55, kChirpSize = 1483, kAntSize = 162,
              kGeoSize = 521, kSrGrSize = 55;
constexpr size_t kSqZdt = 0;
constexpr int kXcaSize = 26552, kInsSize = 171648;
constexpr int kTies = 11;
// Image line header: zero-Doppler time, quality flag (-1 blank), line number.
constexpr size_t kLineTime = 0, kLineQuality = 12, kLineNumber = 13, kLineHeader = 17;

using Bytes = std::vector<uint8_t>;

class Output {
 public:
  bool open(const std::string& path, std::string* error) {
    f_ = std::fopen(path.c_str(), "wb");
    if (!f_) *error = "cannot create " + path;
    path_ = path;
    return f_ != nullptr;
  }
  void write(const void* p, size_t n) {
    if (f_ && std::fwrite(p, 1, n, f_) != n) failed_ = true;
  }
  void write(const std::string& s) { write(s.data(), s.size()); }
  void write(const Bytes& b) { write(b.data(), b.size()); }
  bool close(std::string* error) {
    if (f_ && std::fclose(f_) != 0) failed_ = true;
    f_ = nullptr;
    if (failed_) *error = "write failed: " + path_;
    return !failed_;
  }
  ~Output() {
    if (f_) std::fclose(f_);
  }

 private:
  std::FILE* f_ = nullptr;
  bool failed_ = false;
  std::string path_;
};

std::string path_in(const Scene& s, const std::string& name) {
  std::string dir = s.opt.out_dir;
  if (!dir.empty() && dir.back() != '/') dir += '/';
  return dir + name;
}

// --- xoshiro256** and Box-Muller: deterministic speckle per image line ----
struct Rng {
  uint64_t s[4];
  static uint64_t splitmix(uint64_t& x) {
    uint64_t z = (x += 0x9E3779B97F4A7C15ULL);
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9ULL;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBULL;
    return z ^ (z >> 31);
  }
  explicit Rng(uint64_t seed) {
    for (auto& v : s) v = splitmix(seed);
  }
  static uint64_t rotl(uint64_t x, int k) { return (x << k) | (x >> (64 - k)); }
  uint64_t next() {
    const uint64_t r = rotl(s[1] * 5, 7) * 9;
    const uint64_t t = s[1] << 17;
    s[2] ^= s[0];
    s[3] ^= s[1];
    s[1] ^= s[2];
    s[0] ^= s[3];
    s[2] ^= t;
    s[3] = rotl(s[3], 45);
    return r;
  }
  double uniform() { return ((next() >> 11) + 0.5) * (1.0 / 9007199254740992.0); }  // (0,1)
  void gauss2(double* a, double* b) {
    const double r = std::sqrt(-2.0 * std::log(uniform()));
    const double ph = 2.0 * M_PI * uniform();
    *a = r * std::cos(ph);
    *b = r * std::sin(ph);
  }
};

inline int16_t quantise(double v) {
  const double r = std::floor(v + 0.5);
  return static_cast<int16_t>(r > 32767.0 ? 32767.0 : (r < -32768.0 ? -32768.0 : r));
}

int tie_sample(const SubSwath& w, int first, int j) {
  return first + static_cast<int>(std::lround(j * (w.samples - first) / 10.0));
}
double tie_tau(const Scene& s, const SubSwath& w, int sample) {
  return w.near_tau + (sample - 1) / s.fs;
}

// Which sub-swath's value each of the five slots of a per-beam array holds in
// the record of sub-swath k: its own value in `own_slot` (the slot a reader
// must take), and in every other slot e the value of a sub-swath other than k
// and other than e.  A reader that takes the wrong slot, or the right slot of
// the wrong record, gets a wrong value.
std::array<int, kSubSwaths> slot_owners(int own_slot, int k) {
  std::array<int, kSubSwaths> owner{};
  std::vector<int> slots, others;
  for (int e = 0; e < kSubSwaths; ++e) {
    if (e != own_slot) slots.push_back(e);
    if (e != k) others.push_back(e);
  }
  const size_t n = slots.size();
  for (size_t rot = 1; rot <= n; ++rot) {
    bool ok = true;
    for (size_t i = 0; i < n; ++i) ok = ok && others[(i + rot) % n] != slots[i];
    if (!ok) continue;
    owner[own_slot] = k;
    for (size_t i = 0; i < n; ++i) owner[slots[i]] = others[(i + rot) % n];
    return owner;
  }
  throw std::logic_error("no slot assignment");
}

// Per-beam array of floats or of unsigned integers at `off`.  A wide-swath
// record spreads the sub-swaths over the slots as slot_owners says; an
// image-mode record holds its image's value in slot 0 and zeros elsewhere.
template <typename Get>
void put_beams_f32(Bytes& b, size_t off, const Scene& s, int own_slot, int k, Get get) {
  if (!s.wide_swath) {
    put_f32(b, off, static_cast<float>(get(s.ss[k])));
    return;
  }
  const std::array<int, kSubSwaths> owner = slot_owners(own_slot, k);
  for (int e = 0; e < kSubSwaths; ++e)
    put_f32(b, off + 4 * e, static_cast<float>(get(s.ss[owner[e]])));
}
template <typename Get>
void put_beams_u32(Bytes& b, size_t off, const Scene& s, int own_slot, int k, Get get) {
  if (!s.wide_swath) {
    put_u32(b, off, static_cast<uint32_t>(get(s.ss[k])));
    return;
  }
  const std::array<int, kSubSwaths> owner = slot_owners(own_slot, k);
  for (int e = 0; e < kSubSwaths; ++e)
    put_u32(b, off + 4 * e, static_cast<uint32_t>(get(s.ss[owner[e]])));
}

// ---------------------------------------------------------------- records
// Main processing parameters record fields.
constexpr size_t kMppFirstZdt = 0, kMppLastZdt = 13, kMppWorkOrder = 25, kMppTimeDiff = 37,
                 kMppSwath = 41, kMppRangeSpacing = 44, kMppAzimuthSpacing = 48,
                 kMppLineInterval = 52, kMppLines = 56, kMppSamples = 60, kMppDataType = 64,
                 kMppLinesPerBurst = 69, kMppTimeDiffZeroDoppler = 73, kMppAntElevCorr = 121,
                 kMppRangeSpreadComp = 126, kMppFirstSwst = 643, kMppLastSwst = 663,
                 kMppSwstChanges = 683, kMppPrf = 703, kMppPulseLen = 723, kMppPulseBw = 743,
                 kMppEchoWinLen = 763, kMppRank = 893, kMppSampRate = 983, kMppRadarFreq = 987,
                 kMppRangeLooks = 991, kMppRgWindow = 993, kMppRgWindowCoef = 1000,
                 kMppLookBwRange = 1004, kMppTotBwRange = 1024, kMppLookBwAz = 1270,
                 kMppAzWindow = 1278, kMppAzWindowCoef = 1285, kMppFmRate = 1289,
                 kMppFmOrigin = 1301, kMppProcGain = 1377, kMppExtCal = 1381, kMppNoise = 1393,
                 kMppBeamOverlap = 1685, kMppEchoesPerBurst = 1717, kMppStateVectors = 1765;
// One state vector of the record: time, position (1e-2 m), velocity (1e-5 m/s).
constexpr size_t kSvSize = 36, kSvPos = 12, kSvVel = 24;

Bytes mpp_record(const Scene& s, const SubSwath& w) {
  Bytes b(kMppSize, 0);
  const int k = w.index;
  put_mjd(b, kMppFirstZdt, w.first_time);
  put_mjd(b, kMppLastZdt, w.last_time);
  put_text(b, kMppWorkOrder, "SYNTH0000001");
  put_f32(b, kMppTimeDiff, 0.0f);
  put_text(b, kMppSwath, w.beam);
  put_f32(b, kMppRangeSpacing, static_cast<float>(s.range_spacing));
  put_f32(b, kMppAzimuthSpacing, static_cast<float>(s.azimuth_spacing));
  put_f32(b, kMppLineInterval, static_cast<float>(s.line_interval));
  put_u32(b, kMppLines, static_cast<uint32_t>(w.records));
  put_u32(b, kMppSamples, static_cast<uint32_t>(w.samples));
  put_text(b, kMppDataType, "SWORD");
  put_u32(b, kMppLinesPerBurst, static_cast<uint32_t>(w.lines_per_burst));
  put_f32(b, kMppTimeDiffZeroDoppler, w.time_diff);
  put_u8(b, kMppAntElevCorr, 1);      // elevation antenna pattern corrected
  put_u8(b, kMppRangeSpreadComp, 1);  // range spreading loss compensated
  // Per-beam arrays: the fields read at their base offset have the
  // sub-swath's own value in slot 0, the range bandwidths in slot k.
  put_beams_f32(b, kMppFirstSwst, s, 0, k, [](const SubSwath& v) { return v.near_tau; });
  put_beams_f32(b, kMppLastSwst, s, 0, k, [](const SubSwath& v) { return v.near_tau; });
  put_beams_u32(b, kMppSwstChanges, s, 0, k, [](const SubSwath&) { return 0; });
  put_beams_f32(b, kMppPrf, s, 0, k, [](const SubSwath& v) { return v.prf; });
  put_beams_f32(b, kMppPulseLen, s, 0, k, [](const SubSwath& v) { return v.pulse_len; });
  put_beams_f32(b, kMppPulseBw, s, 0, k, [](const SubSwath& v) { return v.pulse_bw; });
  put_beams_f32(b, kMppEchoWinLen, s, 0, k, [&s](const SubSwath& v) { return v.samples / s.fs; });
  put_beams_u32(b, kMppRank, s, 0, k, [](const SubSwath& v) { return v.rank; });
  put_beams_f32(b, kMppLookBwRange, s, k, k, [](const SubSwath& v) { return v.look_bw; });
  put_beams_f32(b, kMppTotBwRange, s, k, k, [](const SubSwath& v) { return v.pulse_bw; });
  put_beams_u32(b, kMppEchoesPerBurst, s, 0, k, [](const SubSwath& v) { return v.echoes; });
  put_f32(b, kMppSampRate, static_cast<float>(s.fs));
  put_f32(b, kMppRadarFreq, static_cast<float>(s.fc));
  b[kMppRangeLooks] = 0;
  b[kMppRangeLooks + 1] = 1;  // one range look
  put_text(b, kMppRgWindow, "HAMMING");
  put_f32(b, kMppRgWindowCoef, static_cast<float>(w.rg_window_coef));
  put_f32(b, kMppLookBwAz, static_cast<float>(w.az_look_bw));
  put_text(b, kMppAzWindow, "HAMMING");
  put_f32(b, kMppAzWindowCoef, static_cast<float>(w.az_window_coef));
  for (int i = 0; i < 3; ++i) put_f32(b, kMppFmRate + 4 * i, static_cast<float>(w.fm_rate[i]));
  put_f32(b, kMppFmOrigin, static_cast<float>(w.fm_origin_tau * 1e9));
  put_f32(b, kMppProcGain, static_cast<float>(w.proc_gain));
  put_f32(b, kMppExtCal, static_cast<float>(w.ext_cal));
  put_f32(b, kMppNoise, static_cast<float>(w.noise));
  if (s.wide_swath)
    for (int i = 0; i < 4; ++i) put_u32(b, kMppBeamOverlap + 4 * i, 200);
  // Five orbit state vectors spread over the sub-swath (1e-2 m, 1e-5 m/s).
  for (int j = 0; j < 5; ++j) {
    const double t = round_us(w.first_time + (w.last_time - w.first_time) * j / 4.0);
    const State st = s.traj->at(t);
    const size_t o = kMppStateVectors + kSvSize * j;
    put_mjd(b, o, t);
    const double p[3] = {st.p.x, st.p.y, st.p.z}, v[3] = {st.v.x, st.v.y, st.v.z};
    for (int a = 0; a < 3; ++a) {
      put_i32(b, o + kSvPos + 4 * a, static_cast<int32_t>(std::lround(p[a] * 100.0)));
      put_i32(b, o + kSvVel + 4 * a, static_cast<int32_t>(std::lround(v[a] * 1e5)));
    }
  }
  return b;
}

// Doppler centroid record fields.
constexpr size_t kDopZdt = 0, kDopRangeTime = 13, kDopCoef = 17, kDopConf = 37, kDopDelta = 42;

Bytes dop_record(const Scene& s, int j) {
  Bytes b(kDopSize, 0);
  put_mjd(b, kDopZdt, s.dop_times[j]);
  put_f32(b, kDopRangeTime, static_cast<float>(s.dop_ref_tau * 1e9));
  put_f32(b, kDopCoef, static_cast<float>(s.dop_c0[j]));
  put_f32(b, kDopCoef + 4, static_cast<float>(s.dop_c1));
  put_f32(b, kDopConf, 0.9f);
  // Offsets of the sub-swaths' constant terms: wide-swath products only.
  if (s.wide_swath)
    for (int k = 0; k < kSubSwaths; ++k)
      put_i16(b, kDopDelta + 2 * k, static_cast<int16_t>(s.ss[k].dop_delta));
  return b;
}

// Chirp parameters record fields.
constexpr size_t kChirpZdt = 0, kChirpBeam = 13, kChirpPolar = 16, kChirpWidth = 19,
                 kChirpSidelobe = 23, kChirpIslr = 27, kChirpPeak = 31, kChirpRePower = 35,
                 kChirpElevPower = 39, kChirpRefPower = 44, kChirpNormSource = 48;

Bytes chirp_record(const SubSwath& w) {
  Bytes b(kChirpSize, 0);
  put_mjd(b, kChirpZdt, w.first_time);
  put_text(b, kChirpBeam, w.beam);
  put_text(b, kChirpPolar, w.polar);
  put_f32(b, kChirpWidth, static_cast<float>(1.0 / w.pulse_bw));
  put_f32(b, kChirpSidelobe, -13.2f);
  put_f32(b, kChirpIslr, -10.1f);
  put_f32(b, kChirpPeak, 0.0f);
  put_f32(b, kChirpRePower, static_cast<float>(w.chirp_power));
  put_f32(b, kChirpElevPower, static_cast<float>(0.97 * w.chirp_power));
  put_f32(b, kChirpRefPower, static_cast<float>(10.0 * std::log10(w.chirp_power)));
  put_text(b, kChirpNormSource, "NOMINAL");
  return b;
}

// Antenna elevation pattern record fields.
constexpr size_t kAntZdt = 0, kAntBeam = 13, kAntRangeTime = 16, kAntAngle = 60, kAntGain = 104;

// Elevation pattern record: tie ranges of the sub-swath, look angles and the
// two-way pattern of the calibration file there.
bool ant_record(const Scene& s, const SubSwath& w, Bytes* out) {
  Bytes b(kAntSize, 0);
  put_mjd(b, kAntZdt, w.first_time);
  put_text(b, kAntBeam, w.beam);
  const State st = s.traj->at(w.centre.t);
  for (int j = 0; j < kTies; ++j) {
    const double tau = tie_tau(s, w, tie_sample(w, 1, j));
    GroundPoint g;
    if (!zero_doppler_point(st, tau, &g)) return false;
    put_f32(b, kAntRangeTime + 4 * j, static_cast<float>(tau * 1e9));
    put_f32(b, kAntAngle + 4 * j, static_cast<float>(g.look_deg));
    put_f32(b, kAntGain + 4 * j,
            static_cast<float>(xca_pattern_db(w.xca_slot, g.look_deg - w.elev_centre)));
  }
  *out = std::move(b);
  return true;
}

// Geolocation grid record fields; the tie points of the last line follow
// those of the first at the same spacing.
constexpr size_t kGeoFirstZdt = 0, kGeoLineNum = 13, kGeoNumLines = 17, kGeoTrack = 21,
                 kGeoSamples = 25, kGeoRangeTimes = 69, kGeoIncidence = 113, kGeoLats = 157,
                 kGeoLons = 201, kGeoLastZdt = 267, kGeoLastLine = 279 - 25, kGeoSwath = 499;

bool put_ties(const Scene& s, const SubSwath& w, double t, Bytes& b, size_t base) {
  const State st = s.traj->at(t);
  for (int j = 0; j < kTies; ++j) {
    const int n = tie_sample(w, s.opt.first_tie_sample, j);
    const double tau = tie_tau(s, w, n);
    GroundPoint g;
    if (!zero_doppler_point(st, tau, &g)) return false;
    put_u32(b, base + kGeoSamples + 4 * j, static_cast<uint32_t>(n));
    put_f32(b, base + kGeoRangeTimes + 4 * j, static_cast<float>(tau * 1e9));
    put_f32(b, base + kGeoIncidence + 4 * j, static_cast<float>(g.incidence_deg));
    put_i32(b, base + kGeoLats + 4 * j, static_cast<int32_t>(std::lround(g.geo.lat_deg * 1e6)));
    put_i32(b, base + kGeoLons + 4 * j, static_cast<int32_t>(std::lround(g.geo.lon_deg * 1e6)));
  }
  return true;
}

// Grid line `row` of sub-swath w and the next one, which closes its span.
bool geo_record(const Scene& s, const SubSwath& w, int row, Bytes* out) {
  Bytes b(kGeoSize, 0);
  const int step = s.geo_step_lines;
  const double t1 = round_us(w.first_time + row * step * s.line_interval);
  const double t2 = std::min(round_us(t1 + step * s.line_interval), w.last_time);
  put_mjd(b, kGeoFirstZdt, t1);
  put_u32(b, kGeoLineNum, static_cast<uint32_t>(row * step + 1));
  put_u32(b, kGeoNumLines, static_cast<uint32_t>(std::lround((t2 - t1) / s.line_interval)));
  const State a = s.traj->at(t1);
  // Sub-satellite track heading, degrees clockwise from north.
  const Geodetic ga = to_geodetic(a.p), gb = to_geodetic(s.traj->at(t1 + 1.0).p);
  const double heading = std::atan2((gb.lon_deg - ga.lon_deg) * std::cos(ga.lat_deg * M_PI / 180.0),
                                    gb.lat_deg - ga.lat_deg) *
                         180.0 / M_PI;
  put_f32(b, kGeoTrack, static_cast<float>(heading));
  if (!put_ties(s, w, t1, b, 0)) return false;
  put_mjd(b, kGeoLastZdt, t2);
  if (!put_ties(s, w, t2, b, kGeoLastLine)) return false;
  put_text(b, kGeoSwath, w.beam);
  *out = std::move(b);
  return true;
}

// Grid lines of a sub-swath: from its first line, every geo_step_lines line
// intervals, the last span ending at its last line.
int geo_rows(const Scene& s, const SubSwath& w) {
  const double span = s.geo_step_lines * s.line_interval;
  return std::max(1, static_cast<int>(std::ceil((w.last_time - w.first_time) / span - 1e-9)));
}

// The grid records of all sub-swaths in time order: (sub-swath, row).  The
// images of an image-mode product share one grid, that of the first.
std::vector<std::pair<int, int>> geo_order(const Scene& s) {
  std::vector<std::pair<int, int>> order;
  const int grids = s.wide_swath ? s.images : 1;
  for (int k = 0; k < grids; ++k)
    for (int row = 0; row < geo_rows(s, s.ss[k]); ++row) order.emplace_back(k, row);
  auto time_of = [&s](const std::pair<int, int>& e) {
    return s.ss[e.first].first_time + e.second * s.geo_step_lines * s.line_interval;
  };
  std::stable_sort(order.begin(), order.end(),
                   [&](const std::pair<int, int>& x, const std::pair<int, int>& y) {
                     return time_of(x) < time_of(y);
                   });
  return order;
}

// ---------------------------------------------------------------- product
// Sets descriptor i of `d` to an annotation data set of n records.
void set_ads(std::vector<DsdValues>& d, int i, const char* name, int64_t off, int64_t n,
             int64_t size) {
  d[i].name = name;
  d[i].type = 'A';
  d[i].offset = off;
  d[i].size = n * size;
  d[i].num_dsr = n;
  d[i].dsr_size = size;
}

// Descriptor of MDS k+1: its records when it is written, else empty.
void set_mds(const Scene& s, const ProductLayout& L, int k, DsdValues* v) {
  v->name = "MDS" + std::to_string(k + 1);
  v->type = 'M';
  if (k < mds_written(s)) {
    v->offset = L.mds_offset[k];
    v->num_dsr = s.ss[k].records;
    v->dsr_size = s.ss[k].record_size;
    v->size = v->num_dsr * v->dsr_size;
  }
}

// Reference descriptors: auxiliary files by name, no data.
void set_refs(std::vector<DsdValues>& d, int first, const std::vector<const char*>& names,
              const std::vector<std::string>& files) {
  for (size_t i = 0; i < names.size(); ++i) {
    d[first + i].name = names[i];
    d[first + i].type = 'R';
    d[first + i].filename = files[i];
  }
}

constexpr int kProductDsds = 18;
const char* const kProcessorConfig =
    "ASA_CON_AXVIEC20070101_000000_20070101_000000_20991231_000000";
const char* const kExternalCharacterisation =
    "ASA_XCH_AXVIEC20070101_000000_20070101_000000_20991231_000000";

// The wide-swath descriptor order: annotation 0..6, MDS1..MDS5 at 7..11,
// references 12..16 and the Doppler grid at 17.
std::vector<DsdValues> wide_swath_dsds(const Scene& s, const ProductLayout& L) {
  std::vector<DsdValues> d(kProductDsds);
  set_ads(d, 0, "MDS1 SQ ADS", L.sq_offset, kSubSwaths, kSqSize);
  set_ads(d, 1, "MAIN PROCESSING PARAMS ADS", L.mpp_offset, kSubSwaths, kMppSize);
  set_ads(d, 2, "DOP CENTROID COEFFS ADS", L.dop_offset, L.dop_records, kDopSize);
  set_ads(d, 3, "CHIRP PARAMS ADS", L.chirp_offset, kSubSwaths, kChirpSize);
  set_ads(d, 4, "MDS1 ANTENNA ELEV PATT ADS", L.ant_offset, kSubSwaths, kAntSize);
  set_ads(d, 5, "GEOLOCATION GRID ADS", L.geo_offset, L.geo_records, kGeoSize);
  set_ads(d, 6, "SR GR ADS", 0, 0, kSrGrSize);
  for (int k = 0; k < kSubSwaths; ++k) set_mds(s, L, k, &d[7 + k]);
  set_refs(d, 12,
           {"LEVEL 0 PRODUCT", "ASAR PROCESSOR CONFIG", "INSTRUMENT CHARACTERIZATION",
            "EXTERNAL CALIBRATION", "ORBIT STATE VECTOR 1"},
           {"ASA_WS__0PNPDK" + s.product_name.substr(14, 48), kProcessorConfig, s.ins_name,
            s.xca_name, s.orbit_name});
  set_ads(d, 17, "DOP CENTROID GRID ADS", 0, 0, 0);
  return d;
}

// The image-mode descriptor order: per-MDS quality, main processing
// parameters, Doppler, slant-to-ground (empty in slant-range products),
// chirp, per-MDS antenna patterns, geolocation, map projection (empty),
// MDS1, MDS2, then the references.  The second MDS's own descriptors are
// empty in single-image products.
std::vector<DsdValues> image_mode_dsds(const Scene& s, const ProductLayout& L) {
  std::vector<DsdValues> d(kProductDsds);
  const int two = s.images > 1 ? 1 : 0;
  set_ads(d, 0, "MDS1 SQ ADS", L.sq_offset, 1, kSqSize);
  set_ads(d, 1, "MDS2 SQ ADS", two ? L.sq_offset + kSqSize : 0, two, kSqSize);
  set_ads(d, 2, "MAIN PROCESSING PARAMS ADS", L.mpp_offset, s.images, kMppSize);
  set_ads(d, 3, "DOP CENTROID COEFFS ADS", L.dop_offset, L.dop_records, kDopSize);
  set_ads(d, 4, "SR GR ADS", 0, 0, kSrGrSize);
  set_ads(d, 5, "CHIRP PARAMS ADS", L.chirp_offset, s.images, kChirpSize);
  set_ads(d, 6, "MDS1 ANTENNA ELEV PATT ADS", L.ant_offset, 1, kAntSize);
  set_ads(d, 7, "MDS2 ANTENNA ELEV PATT ADS", two ? L.ant_offset + kAntSize : 0, two, kAntSize);
  set_ads(d, 8, "GEOLOCATION GRID ADS", L.geo_offset, L.geo_records, kGeoSize);
  set_ads(d, 9, "MAP PROJECTION GADS", 0, 0, 0);
  d[9].type = 'G';
  for (int k = 0; k < 2; ++k) set_mds(s, L, k, &d[10 + k]);
  const std::string level0 = s.product_type == "APS" ? "ASA_AP__0PNPDK" : "ASA_IM__0PNPDK";
  set_refs(d, 12,
           {"LEVEL 0 PRODUCT", "ASAR PROCESSOR CONFIG", "INSTRUMENT CHARACTERIZATION",
            "EXTERNAL CHARACTERIZATION", "EXTERNAL CALIBRATION", "ORBIT STATE VECTOR 1"},
           {level0 + s.product_name.substr(14, 48), kProcessorConfig, s.ins_name,
            kExternalCharacterisation, s.xca_name, s.orbit_name});
  return d;
}

bool write_product(const Scene& s, const ProductLayout& L, std::string* error) {
  const Options& o = s.opt;
  const int nmds = mds_written(s);
  MphValues m;
  m.product = s.product_name;
  m.proc_time = std::floor(s.t0) + 86400.0;
  m.sensing_start = s.t0;
  m.sensing_stop = s.stop;
  m.cycle = s.cycle;
  m.rel_orbit = s.rel_orbit;
  m.abs_orbit = s.abs_orbit;
  m.has_state = true;
  m.sv_time = s.t0;
  const State st = s.traj->at(s.t0);
  m.pos[0] = st.p.x, m.pos[1] = st.p.y, m.pos[2] = st.p.z;
  m.vel[0] = st.v.x, m.vel[1] = st.v.y, m.vel[2] = st.v.z;
  m.tot_size = L.tot_size;
  m.sph_size = kWssSphSize;
  m.num_dsd = 18;
  m.num_data_sets = 18;

  ImageSphValues sp;
  sp.first_line = s.t0;
  sp.last_line = s.stop;
  for (int i = 0; i < 6; ++i) {
    sp.corner_lat[i] = s.sph_lat[i];
    sp.corner_lon[i] = s.sph_lon[i];
  }
  sp.descriptor = s.descriptor;
  sp.swath = s.swath;
  sp.algorithm = s.algorithm;
  sp.pass = s.pass;
  sp.polar1 = s.ss[0].polar;
  if (s.images > 1 && !s.wide_swath) sp.polar2 = s.ss[1].polar;
  sp.range_spacing = s.range_spacing;
  sp.azimuth_spacing = s.azimuth_spacing;
  sp.line_interval = s.line_interval;
  sp.line_length = s.ss[0].samples;

  std::vector<DsdValues> d = s.wide_swath ? wide_swath_dsds(s, L) : image_mode_dsds(s, L);
  // Requested defects in the descriptors.
  if (o.zero_count >= 0) {
    d[o.zero_count].num_dsr = 0;
    d[o.zero_count].size = 0;
  }
  if (o.dsd_beyond_end >= 0 && o.dsd_beyond_end < static_cast<int>(d.size()))
    d[o.dsd_beyond_end].offset = L.tot_size + 4096;

  Output out;
  if (!out.open(path_in(s, s.product_name), error)) return false;
  std::string head = build_mph(m) + build_image_sph(sp);
  for (const DsdValues& v : d) head += build_dsd(v);
  out.write(head);

  // Annotation data sets.
  for (int k = 0; k < s.images; ++k) {
    Bytes b(kSqSize, 0);
    put_mjd(b, kSqZdt, s.ss[k].first_time);
    out.write(b);
  }
  for (int k = 0; k < s.images; ++k) out.write(mpp_record(s, s.ss[k]));
  for (int j = 0; j < L.dop_records; ++j) out.write(dop_record(s, j));
  for (int k = 0; k < s.images; ++k) out.write(chirp_record(s.ss[k]));
  for (int k = 0; k < s.images; ++k) {
    Bytes b;
    if (!ant_record(s, s.ss[k], &b)) {
      *error = "no ground intersection for the antenna pattern records";
      return false;
    }
    out.write(b);
  }
  for (const std::pair<int, int>& e : geo_order(s)) {
    Bytes b;
    if (!geo_record(s, s.ss[e.first], e.second, &b)) {
      *error = "no ground intersection for the geolocation grid";
      return false;
    }
    out.write(b);
  }

  // Image lines, burst after burst, in large buffered writes.
  const Pattern& p = s.pattern;
  for (int k = 0; k < nmds; ++k) {
    const SubSwath& w = s.ss[k];
    const int n = w.samples;
    const int lpb = w.lines_per_burst;
    std::vector<double> drg(n);
    std::vector<long> rcell(n);
    for (int i = 0; i < n; ++i) {
      drg[i] = (w.near_tau - s.ss[0].near_tau) + i / s.fs;
      rcell[i] = static_cast<long>(std::floor(drg[i] / p.rg_cell));
    }
    std::unique_ptr<BandLimitedNoise> band;
    if (o.band_limit) band.reset(new BandLimitedNoise(n, s.fs, w.band));
    std::vector<cplx> spectrum(band ? band->bins() : 0), noise(n);
    std::vector<double> amp(n);
    const size_t rec = static_cast<size_t>(w.record_size);
    const size_t per_chunk = std::max<size_t>(1, (8u << 20) / rec);
    Bytes buf;
    buf.reserve(per_chunk * rec);
    for (int r = 0; r < w.records; ++r) {
      const int i = lpb > 0 ? r % lpb : 0;  // line within its burst
      const double t = record_time(s, w, r);
      const bool blank = r < o.blank_first || r >= w.records - o.blank_last;
      const size_t base = buf.size();
      buf.resize(base + rec);
      uint8_t* q = &buf[base];
      const Mjd mj = blank && o.blank_zero_time ? Mjd() : to_mjd(t);
      const uint32_t hdr[3] = {static_cast<uint32_t>(mj.days), mj.seconds, mj.microseconds};
      for (int h = 0; h < 3; ++h)
        for (int x = 0; x < 4; ++x)
          q[kLineTime + 4 * h + x] = static_cast<uint8_t>(hdr[h] >> (24 - 8 * x));
      q[kLineQuality] = blank ? 0xFF : 0;
      const uint32_t num = static_cast<uint32_t>(r + 1);
      for (int x = 0; x < 4; ++x) q[kLineNumber + x] = static_cast<uint8_t>(num >> (24 - 8 * x));
      q += kLineHeader;
      if (blank) {
        std::fill(q, q + 4 * n, 0);
      } else {
        // Amplitude: scale x sqrt(taper power) x sqrt(reflectivity).
        const double daz = t - s.t0;
        const double a0 = p.scale * (p.tapered ? std::sqrt(burst_taper(i, lpb)) : 1.0);
        if (p.kind == "checkerboard") {
          const long ac = static_cast<long>(std::floor(daz / p.az_cell));
          const double hi = a0 * std::sqrt(p.high), lo = a0 * std::sqrt(p.low);
          for (int x = 0; x < n; ++x) amp[x] = ((ac + rcell[x]) % 2 == 0) ? hi : lo;
        } else if (p.kind == "points") {
          std::fill(amp.begin(), amp.end(), a0 * std::sqrt(p.background));
          for (const Target& tg : p.targets) {
            if (std::fabs(daz - tg.t) > p.target_half_az) continue;
            for (int x = 0; x < n; ++x)
              if (std::fabs(drg[x] - tg.tau) <= p.target_half_rg)
                amp[x] = a0 * std::sqrt(p.target_level);
          }
        } else {
          std::fill(amp.begin(), amp.end(), a0);
        }
        // Unit-variance complex normal speckle, white or band-limited.
        Rng rng(o.seed * 0x100000001B3ULL ^ (static_cast<uint64_t>(k) << 40) ^
                static_cast<uint64_t>(r));
        double gi, gq;
        if (band) {
          for (cplx& v : spectrum) {
            rng.gauss2(&gi, &gq);
            v = cplx(gi, gq);
          }
          band->line(spectrum, &noise);
        } else {
          for (cplx& v : noise) {
            rng.gauss2(&gi, &gq);
            v = cplx(gi, gq);
          }
        }
        for (int x = 0; x < n; ++x) {
          const uint16_t vi = static_cast<uint16_t>(quantise(amp[x] * noise[x].real()));
          const uint16_t vq = static_cast<uint16_t>(quantise(amp[x] * noise[x].imag()));
          q[0] = static_cast<uint8_t>(vi >> 8);
          q[1] = static_cast<uint8_t>(vi);
          q[2] = static_cast<uint8_t>(vq >> 8);
          q[3] = static_cast<uint8_t>(vq);
          q += 4;
        }
      }
      if (buf.size() + rec > buf.capacity()) {
        out.write(buf);
        buf.clear();
      }
    }
    out.write(buf);
  }
  if (!out.close(error)) return false;
  if (o.truncate_at >= 0) {
    std::error_code ec;
    const auto size = std::filesystem::file_size(path_in(s, s.product_name), ec);
    if (!ec && static_cast<uint64_t>(o.truncate_at) < size)
      std::filesystem::resize_file(path_in(s, s.product_name),
                                   static_cast<uintmax_t>(o.truncate_at), ec);
    if (ec) {
      *error = "cannot truncate the product: " + ec.message();
      return false;
    }
  }
  return true;
}

// ------------------------------------------------------- auxiliary files
MphValues aux_mph(const std::string& name, double start, double stop, int64_t size) {
  MphValues m;
  m.product = name;
  m.proc_stage = 'V';
  m.ref_doc = "PO-RS-MDA-GS-2009_08_4A";
  m.station = "PDHS-E";
  m.proc_center = "PDHS-E";
  m.proc_time = start - 86400.0;
  m.software = "";
  m.sensing_start = start;
  m.sensing_stop = stop;
  m.phase = 'X';
  m.tot_size = size;
  m.sph_size = kAuxSphSize;
  m.num_dsd = 1;
  m.num_data_sets = 1;
  return m;
}

bool write_single_record_file(const Scene& s, const std::string& name, const std::string& desc,
                              const Bytes& rec, std::string* error) {
  DsdValues d;
  d.name = "Asar auxiliary data";
  d.type = 'G';
  d.offset = kAuxDataOffset;
  d.size = static_cast<int64_t>(rec.size());
  d.num_dsr = 1;
  d.dsr_size = d.size;
  Output out;
  if (!out.open(path_in(s, name), error)) return false;
  out.write(build_mph(aux_mph(name, s.xca_start, s.xca_stop, kAuxDataOffset + d.size)));
  out.write(build_aux_sph(desc, d));
  out.write(rec);
  return out.close(error);
}

double ref_angle(const Scene& s, int slot) {
  // Slots of the scene's images carry their centre look angles; the others
  // keep nominal values (those of a real calibration file).
  const double nominal[8] = {16.628, 20.138, 25.243, 29.533, 32.818, 35.633, 38.058, 19.163};
  for (int k = 0; k < s.images; ++k)
    if (s.ss[k].xca_slot == slot) return s.ss[k].elev_centre;
  return nominal[slot];
}

// External calibration record fields.
constexpr size_t kXcaTime = 0, kXcaLength = 12, kXcaWsHh = 744, kXcaWsVv = 748, kXcaRefAngles = 760,
                 kXcaPatterns = 792, kXcaPatternFloats = 804, kXcaWsSlcHh = 26520,
                 kXcaWsSlcVv = 26524;
constexpr int kXcaPolarisations = 4, kXcaPatternPoints = 201;

bool write_xca(const Scene& s, std::string* error) {
  Bytes r(kXcaSize, 0);
  put_mjd(r, kXcaTime, s.xca_start);
  put_u32(r, kXcaLength, kXcaSize);
  put_f32(r, kXcaWsHh, 4.5e5f);
  put_f32(r, kXcaWsVv, 4.6e5f);
  put_f32(r, kXcaWsSlcHh, 4.5e5f);
  put_f32(r, kXcaWsSlcVv, 4.6e5f);
  for (int slot = 0; slot < 8; ++slot) {
    put_f32(r, kXcaRefAngles + 4 * slot, static_cast<float>(ref_angle(s, slot)));
    for (int pol = 0; pol < kXcaPolarisations; ++pol)
      for (int i = 0; i < kXcaPatternPoints; ++i)
        put_f32(r, kXcaPatterns + (pol + kXcaPolarisations * slot) * kXcaPatternFloats + 4 * i,
                static_cast<float>(xca_pattern_db(slot, (i - 100) * 0.05)));
  }
  return write_single_record_file(s, s.xca_name, "AUX XCA FILE", r, error);
}

// Instrument characterisation record fields; one block of test structures
// (temperature, eight droop gains as doubles) per mode.
constexpr size_t kInsTime = 0, kInsLength = 12, kInsRadarFreq = 16, kInsSampRate = 20,
                 kInsOffsetFreq = 24, kInsRefAngles = 161920, kInsTests = 171232, kInsTestSize = 68,
                 kInsDroop = 4;

bool write_ins(const Scene& s, std::string* error) {
  Bytes r(kInsSize, 0);
  put_mjd(r, kInsTime, s.xca_start);
  put_u32(r, kInsLength, kInsSize);
  put_f32(r, kInsRadarFreq, static_cast<float>(s.fc));
  put_f32(r, kInsSampRate, static_cast<float>(s.fs));
  put_f32(r, kInsOffsetFreq, 0.0f);
  for (int slot = 0; slot < 8; ++slot)
    put_f32(r, kInsRefAngles + 4 * slot, static_cast<float>(ref_angle(s, slot)));
  for (int mode = 0; mode < 5; ++mode) {
    const size_t o = kInsTests + kInsTestSize * mode;
    put_f32(r, o, static_cast<float>(s.temperature + (mode - 2)));
    for (int i = 0; i < 8; ++i) put_f64(r, o + kInsDroop + 8 * i, s.droop[i] - 0.001 * (mode - 2));
  }
  return write_single_record_file(s, s.ins_name, "AUX INS FILE", r, error);
}

bool write_orbit(const Scene& s, std::string* error) {
  if (!s.kepler) {
    std::error_code ec;
    std::filesystem::copy_file(s.orbit_source, path_in(s, s.orbit_name),
                               std::filesystem::copy_options::overwrite_existing, ec);
    // A read-only original stays writable in the copy, so that a later run
    // into the same folder can replace it.
    if (!ec)
      std::filesystem::permissions(path_in(s, s.orbit_name), std::filesystem::perms::owner_write,
                                   std::filesystem::perm_options::add, ec);
    if (ec) *error = "cannot copy the orbit file: " + ec.message();
    return !ec;
  }
  const double first = s.orbit_first, last = s.orbit_last;
  const int n = static_cast<int>(std::lround((last - first) / 60.0)) + 1;
  DsdValues d;
  d.name = "DORIS PRECISE ORBIT";
  d.type = 'M';
  d.filename = "NOT USED";
  d.offset = kAuxDataOffset;
  d.size = 129LL * n;
  d.num_dsr = n;
  d.dsr_size = 129;
  MphValues m = aux_mph(s.orbit_name, first, last, kAuxDataOffset + d.size);
  m.station = "ORBITE MISSION";
  m.proc_center = "O_M";
  m.software = "orbito/3.5";
  m.cycle = s.cycle;
  Output out;
  if (!out.open(path_in(s, s.orbit_name), error)) return false;
  out.write(build_mph(m));
  out.write(build_aux_sph("ORBITE POE_REST SAT ENV1", d));
  for (int i = 0; i < n; ++i) {
    const State st = s.traj->at(first + 60.0 * i);
    const double p[3] = {st.p.x, st.p.y, st.p.z}, v[3] = {st.v.x, st.v.y, st.v.z};
    out.write(doris_record(first + 60.0 * i, -0.331385, st.abs_orbit, p, v));
  }
  return out.close(error);
}

bool write_aux_list(const Scene& s, std::string* error) {
  std::string t;
  auto entry = [&](const char* section, double a, double b, const std::string& file) {
    t += "\n[" + std::string(section) + "]\nStartDate = " + format_utc(a) +
         "\nStopDate = " + format_utc(b) + "\nFileName = " + file + "\n";
  };
  // The first entries of each type end before the scene: they must not be chosen.
  const double old_a = s.xca_start - 400 * 86400.0, old_b = s.xca_start - 30 * 86400.0;
  entry("ASA_XCA_0", old_a, old_b,
        "ASA_XCA_AXVIEC" + format_compact(old_a - 86400.0) + "_" + format_compact(old_a) + "_" +
            format_compact(old_b));
  entry("ASA_XCA_1", s.xca_start, s.xca_stop, s.xca_name);
  entry("ASA_INS_0", old_a, old_b,
        "ASA_INS_AXVIEC" + format_compact(old_a - 86400.0) + "_" + format_compact(old_a) + "_" +
            format_compact(old_b));
  entry("ASA_INS_1", s.xca_start, s.xca_stop, s.ins_name);
  Output out;
  if (!out.open(path_in(s, "ASA_AUX_list.dat"), error)) return false;
  out.write(t);
  return out.close(error);
}

}  // namespace

ProductLayout layout_of(const Scene& s) {
  ProductLayout L;
  int64_t off = kMphSize + kWssSphSize;
  L.sq_offset = off;
  off += s.images * kSqSize;
  L.mpp_offset = off;
  off += s.images * kMppSize;
  L.dop_offset = off;
  L.dop_records = static_cast<int>(s.dop_times.size());
  off += static_cast<int64_t>(L.dop_records) * kDopSize;
  L.chirp_offset = off;
  off += s.images * kChirpSize;
  L.ant_offset = off;
  off += s.images * kAntSize;
  L.geo_offset = off;
  L.geo_records = static_cast<int>(geo_order(s).size());
  off += static_cast<int64_t>(L.geo_records) * kGeoSize;
  const int nmds = mds_written(s);
  for (int k = 0; k < nmds; ++k) {
    L.mds_offset[k] = off;
    off += static_cast<int64_t>(s.ss[k].records) * s.ss[k].record_size;
  }
  L.tot_size = off;
  return L;
}

bool write_truth(const Scene& s, const ProductLayout& L, std::string* error);

bool write_scene(const Scene& s, std::string* error) {
  const ProductLayout L = layout_of(s);
  return write_orbit(s, error) && write_xca(s, error) && write_ins(s, error) &&
         write_aux_list(s, error) && write_product(s, L, error) && write_truth(s, L, error);
}

}  // namespace synth
