#include "synth_writer.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <memory>
#include <vector>

#include "synth_format.h"

namespace synth {
namespace {

constexpr int kSqSize = 170, kMppSize = 2009, kDopSize = 55, kChirpSize = 1483, kAntSize = 162,
              kGeoSize = 521;
constexpr int kXcaSize = 26552, kInsSize = 171648;
constexpr int kTies = 11;

// Calibration-file slot of a sub-swath: SS1 has its own, SS2..SS5 share IS3..IS6.
int slot_of(int k) {
  return k == 0 ? 7 : k + 1;
}

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

double line_time(const Scene& s, int burst, int line) {
  return round_us(s.t0 + (burst * s.cycle_lines + line) * s.line_interval);
}
double grid_time(const Scene& s, int g) {
  return round_us(s.t0 + g * s.line_interval);
}

int tie_sample(const SubSwath& w, int j) {
  return 1 + static_cast<int>(std::lround(j * (w.samples - 1) / 10.0));
}
double tie_tau(const Scene& s, const SubSwath& w, int sample) {
  return w.near_tau + (sample - 1) / s.fs;
}

// ---------------------------------------------------------------- records
Bytes mpp_record(const Scene& s, const SubSwath& w) {
  Bytes b(kMppSize, 0);
  put_mjd(b, 0, w.first_time);
  put_mjd(b, 13, w.last_time);
  put_text(b, 25, "SYNTH0000001");
  put_f32(b, 37, 0.0f);
  put_text(b, 41, "SS" + std::to_string(w.index + 1));
  put_f32(b, 44, static_cast<float>(s.range_spacing));
  put_f32(b, 48, static_cast<float>(s.azimuth_spacing));
  put_f32(b, 52, static_cast<float>(s.line_interval));
  put_u32(b, 56, static_cast<uint32_t>(w.records));
  put_u32(b, 60, static_cast<uint32_t>(w.samples));
  put_text(b, 64, "SWORD");
  put_u32(b, 69, static_cast<uint32_t>(s.lines_per_burst));
  put_f32(b, 73, static_cast<float>(s.time_diff_zd));
  put_u8(b, 121, 1);  // elevation antenna pattern corrected
  put_u8(b, 126, 1);  // range spreading loss compensated
  // Per-beam arrays: in the record of a sub-swath every element holds its value.
  for (int e = 0; e < 5; ++e) {
    put_f32(b, 643 + 4 * e, static_cast<float>(w.near_tau));
    put_f32(b, 663 + 4 * e, static_cast<float>(w.near_tau));
    put_u32(b, 683 + 4 * e, 0);
    put_f32(b, 703 + 4 * e, static_cast<float>(w.prf));
    put_f32(b, 723 + 4 * e, static_cast<float>(w.pulse_len));
    put_f32(b, 743 + 4 * e, static_cast<float>(w.pulse_bw));
    put_f32(b, 763 + 4 * e, static_cast<float>(w.samples / s.fs));
    put_u32(b, 893 + 4 * e, static_cast<uint32_t>(w.rank));
    put_f32(b, 1004 + 4 * e, static_cast<float>(w.pulse_bw));
    put_f32(b, 1024 + 4 * e, static_cast<float>(w.pulse_bw));
    put_u32(b, 1717 + 4 * e, static_cast<uint32_t>(w.echoes));
  }
  put_f32(b, 983, static_cast<float>(s.fs));
  put_f32(b, 987, static_cast<float>(s.fc));
  b[991] = 0;
  b[992] = 1;  // one range look
  put_text(b, 993, "HAMMING");
  put_f32(b, 1000, 0.75f);
  put_f32(b, 1270, 1040.0f);
  put_text(b, 1278, "HAMMING");
  put_f32(b, 1285, 0.75f);
  for (int i = 0; i < 3; ++i) put_f32(b, 1289 + 4 * i, static_cast<float>(w.fm_rate[i]));
  put_f32(b, 1301, static_cast<float>(w.fm_origin_tau * 1e9));
  put_f32(b, 1377, 1.0f);
  put_f32(b, 1381, static_cast<float>(1.0e5 * (1.0 + 0.1 * w.index)));
  put_f32(b, 1393, static_cast<float>(2.0 + 0.25 * w.index));
  for (int i = 0; i < 4; ++i) put_u32(b, 1685 + 4 * i, 200);
  // Five orbit state vectors spread over the scene (1e-2 m, 1e-5 m/s).
  for (int j = 0; j < 5; ++j) {
    const double t = round_us(w.first_time + (w.last_time - w.first_time) * j / 4.0);
    const State st = s.traj->at(t);
    const size_t o = 1765 + 36 * j;
    put_mjd(b, o, t);
    const double p[3] = {st.p.x, st.p.y, st.p.z}, v[3] = {st.v.x, st.v.y, st.v.z};
    for (int a = 0; a < 3; ++a) {
      put_i32(b, o + 12 + 4 * a, static_cast<int32_t>(std::lround(p[a] * 100.0)));
      put_i32(b, o + 24 + 4 * a, static_cast<int32_t>(std::lround(v[a] * 1e5)));
    }
  }
  return b;
}

Bytes dop_record(const Scene& s, int j) {
  Bytes b(kDopSize, 0);
  put_mjd(b, 0, s.dop_times[j]);
  put_f32(b, 13, static_cast<float>(s.dop_ref_tau * 1e9));
  put_f32(b, 17, static_cast<float>(s.dop_c0[j]));
  put_f32(b, 21, static_cast<float>(s.dop_c1));
  put_f32(b, 37, 0.9f);
  for (int k = 0; k < kSubSwaths; ++k)
    put_i16(b, 42 + 2 * k, static_cast<int16_t>(s.ss[k].dop_delta));
  return b;
}

Bytes chirp_record(const Scene& s, const SubSwath& w) {
  Bytes b(kChirpSize, 0);
  put_mjd(b, 0, w.first_time);
  put_text(b, 13, "SS" + std::to_string(w.index + 1));
  put_text(b, 16, s.polar);
  put_f32(b, 19, static_cast<float>(1.0 / w.pulse_bw));
  put_f32(b, 23, -13.2f);
  put_f32(b, 27, -10.1f);
  put_f32(b, 31, 0.0f);
  put_f32(b, 35, static_cast<float>(w.chirp_power));
  put_f32(b, 39, static_cast<float>(w.chirp_power));
  put_f32(b, 44, static_cast<float>(10.0 * std::log10(w.chirp_power)));
  put_text(b, 48, "NOMINAL");
  return b;
}

// Elevation pattern record: tie ranges of the sub-swath, look angles and the
// two-way pattern of the calibration file there.
bool ant_record(const Scene& s, const SubSwath& w, Bytes* out) {
  Bytes b(kAntSize, 0);
  put_mjd(b, 0, w.first_time);
  put_text(b, 13, "SS" + std::to_string(w.index + 1));
  const State st = s.traj->at(w.centre.t);
  for (int j = 0; j < kTies; ++j) {
    const double tau = tie_tau(s, w, tie_sample(w, j));
    GroundPoint g;
    if (!zero_doppler_point(st, tau, &g)) return false;
    put_f32(b, 16 + 4 * j, static_cast<float>(tau * 1e9));
    put_f32(b, 60 + 4 * j, static_cast<float>(g.look_deg));
    put_f32(b, 104 + 4 * j,
            static_cast<float>(xca_pattern_db(slot_of(w.index), g.look_deg - w.elev_centre)));
  }
  *out = std::move(b);
  return true;
}

bool put_ties(const Scene& s, const SubSwath& w, double t, Bytes& b, size_t samp, size_t srt,
              size_t inc, size_t lat, size_t lon) {
  const State st = s.traj->at(t);
  for (int j = 0; j < kTies; ++j) {
    const int n = tie_sample(w, j);
    const double tau = tie_tau(s, w, n);
    GroundPoint g;
    if (!zero_doppler_point(st, tau, &g)) return false;
    put_u32(b, samp + 4 * j, static_cast<uint32_t>(n));
    put_f32(b, srt + 4 * j, static_cast<float>(tau * 1e9));
    put_f32(b, inc + 4 * j, static_cast<float>(g.incidence_deg));
    put_i32(b, lat + 4 * j, static_cast<int32_t>(std::lround(g.geo.lat_deg * 1e6)));
    put_i32(b, lon + 4 * j, static_cast<int32_t>(std::lround(g.geo.lon_deg * 1e6)));
  }
  return true;
}

bool geo_record(const Scene& s, const SubSwath& w, int g_first, int g_last, Bytes* out) {
  Bytes b(kGeoSize, 0);
  const double t1 = grid_time(s, g_first), t2 = grid_time(s, g_last);
  put_mjd(b, 0, t1);
  put_u32(b, 13, static_cast<uint32_t>(g_first + 1));
  put_u32(b, 17, static_cast<uint32_t>(g_last - g_first));
  const State a = s.traj->at(t1);
  // Sub-satellite track heading, degrees clockwise from north.
  const Geodetic ga = to_geodetic(a.p), gb = to_geodetic(s.traj->at(t1 + 1.0).p);
  const double heading = std::atan2((gb.lon_deg - ga.lon_deg) * std::cos(ga.lat_deg * M_PI / 180.0),
                                    gb.lat_deg - ga.lat_deg) *
                         180.0 / M_PI;
  put_f32(b, 21, static_cast<float>(heading));
  if (!put_ties(s, w, t1, b, 25, 69, 113, 157, 201)) return false;
  put_mjd(b, 267, t2);
  if (!put_ties(s, w, t2, b, 279, 323, 367, 411, 455)) return false;
  put_text(b, 499, "SS" + std::to_string(w.index + 1));
  *out = std::move(b);
  return true;
}

// ---------------------------------------------------------------- product
bool write_product(const Scene& s, const ProductLayout& L, std::string* error) {
  const Options& o = s.opt;
  const int nmds = std::max(0, std::min(o.mds_count, kSubSwaths));
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
  const SubSwath& s1 = s.ss[0];
  const SubSwath& s5 = s.ss[4];
  const double taus[3] = {s1.near_tau, (s1.near_tau + s5.far_tau) / 2, s5.far_tau};
  const double times[2] = {s.t0, s.stop};
  for (int a = 0; a < 2; ++a)
    for (int r = 0; r < 3; ++r) {
      GroundPoint g;
      if (!zero_doppler_point(s.traj->at(times[a]), taus[r], &g)) {
        *error = "no ground intersection for the product corners";
        return false;
      }
      sp.corner_lat[3 * a + r] = g.geo.lat_deg;
      sp.corner_lon[3 * a + r] = g.geo.lon_deg;
    }
  sp.pass = s.pass;
  sp.polar1 = s.polar;
  sp.range_spacing = s.range_spacing;
  sp.azimuth_spacing = s.azimuth_spacing;
  sp.line_interval = s.line_interval;
  sp.line_length = s.ss[0].samples;

  // Data set descriptors in the wide-swath order.
  std::vector<DsdValues> d(18);
  auto ads = [&](int i, const char* name, int64_t off, int64_t n, int64_t size) {
    d[i].name = name;
    d[i].type = 'A';
    d[i].offset = off;
    d[i].size = n * size;
    d[i].num_dsr = n;
    d[i].dsr_size = size;
  };
  ads(0, "MDS1 SQ ADS", L.sq_offset, kSubSwaths, kSqSize);
  ads(1, "MAIN PROCESSING PARAMS ADS", L.mpp_offset, kSubSwaths, kMppSize);
  ads(2, "DOP CENTROID COEFFS ADS", L.dop_offset, L.dop_records, kDopSize);
  ads(3, "CHIRP PARAMS ADS", L.chirp_offset, kSubSwaths, kChirpSize);
  ads(4, "MDS1 ANTENNA ELEV PATT ADS", L.ant_offset, kSubSwaths, kAntSize);
  ads(5, "GEOLOCATION GRID ADS", L.geo_offset, L.geo_records, kGeoSize);
  ads(6, "SR GR ADS", 0, 0, 55);
  for (int k = 0; k < kSubSwaths; ++k) {
    DsdValues& v = d[7 + k];
    v.name = "MDS" + std::to_string(k + 1);
    v.type = 'M';
    if (k < nmds) {
      v.offset = L.mds_offset[k];
      v.num_dsr = s.ss[k].records;
      v.dsr_size = s.ss[k].record_size;
      v.size = v.num_dsr * v.dsr_size;
    }
  }
  const char* refs[6] = {
      "LEVEL 0 PRODUCT",      "ASAR PROCESSOR CONFIG", "INSTRUMENT CHARACTERIZATION",
      "EXTERNAL CALIBRATION", "ORBIT STATE VECTOR 1",  "DOP CENTROID GRID ADS"};
  const std::string ref_files[6] = {"ASA_WS__0PNPDK" + s.product_name.substr(14, 48),
                                    "ASA_CON_AXVIEC20070101_000000_20070101_000000_20991231_000000",
                                    s.ins_name,
                                    s.xca_name,
                                    s.orbit_name,
                                    ""};
  for (int i = 0; i < 6; ++i) {
    d[12 + i].name = refs[i];
    d[12 + i].type = i == 5 ? 'A' : 'R';
    d[12 + i].filename = ref_files[i];
  }
  // Requested defects in the descriptors.
  if (o.zero_count >= 0 && o.zero_count <= 6) {
    d[o.zero_count].num_dsr = 0;
    d[o.zero_count].size = 0;
  }
  if (o.dsd_beyond_end >= 0 && o.dsd_beyond_end < 18)
    d[o.dsd_beyond_end].offset = L.tot_size + 4096;

  Output out;
  if (!out.open(path_in(s, s.product_name), error)) return false;
  std::string head = build_mph(m) + build_image_sph(sp);
  for (const DsdValues& v : d) head += build_dsd(v);
  out.write(head);

  // Annotation data sets.
  for (int k = 0; k < kSubSwaths; ++k) {
    Bytes b(kSqSize, 0);
    put_mjd(b, 0, s.ss[k].first_time);
    out.write(b);
  }
  for (int k = 0; k < kSubSwaths; ++k) out.write(mpp_record(s, s.ss[k]));
  for (int j = 0; j < L.dop_records; ++j) out.write(dop_record(s, j));
  for (int k = 0; k < kSubSwaths; ++k) out.write(chirp_record(s, s.ss[k]));
  for (int k = 0; k < kSubSwaths; ++k) {
    Bytes b;
    if (!ant_record(s, s.ss[k], &b)) {
      *error = "no ground intersection for the antenna pattern records";
      return false;
    }
    out.write(b);
  }
  for (int r = 0; r < L.geo_segments; ++r)
    for (int k = 0; k < kSubSwaths; ++k) {
      const int g1 = r * L.geo_step;
      const int g2 = std::min(g1 + L.geo_step, s.grid_lines - 1);
      Bytes b;
      if (!geo_record(s, s.ss[k], g1, g2, &b)) {
        *error = "no ground intersection for the geolocation grid";
        return false;
      }
      out.write(b);
    }

  // Image lines, burst after burst, in large buffered writes.
  const Pattern& p = s.pattern;
  const int lpb = s.lines_per_burst;
  for (int k = 0; k < nmds; ++k) {
    const SubSwath& w = s.ss[k];
    const int n = w.samples;
    std::vector<double> drg(n);
    std::vector<long> rcell(n);
    for (int i = 0; i < n; ++i) {
      drg[i] = (w.near_tau - s.ss[0].near_tau) + i / s.fs;
      rcell[i] = static_cast<long>(std::floor(drg[i] / p.rg_cell));
    }
    std::vector<double> amp(n);
    const size_t rec = static_cast<size_t>(w.record_size);
    const size_t per_chunk = std::max<size_t>(1, (8u << 20) / rec);
    Bytes buf;
    buf.reserve(per_chunk * rec);
    for (int j = 0; j < s.bursts; ++j)
      for (int i = 0; i < lpb; ++i) {
        const int r = j * lpb + i;
        const double t = line_time(s, j, i);
        const bool blank = r < o.blank_first || r >= w.records - o.blank_last;
        const size_t base = buf.size();
        buf.resize(base + rec);
        uint8_t* q = &buf[base];
        const Mjd mj = to_mjd(t);
        const uint32_t hdr[3] = {static_cast<uint32_t>(mj.days), mj.seconds, mj.microseconds};
        for (int h = 0; h < 3; ++h)
          for (int x = 0; x < 4; ++x) q[4 * h + x] = static_cast<uint8_t>(hdr[h] >> (24 - 8 * x));
        q[12] = blank ? 0xFF : 0;
        const uint32_t num = static_cast<uint32_t>(r + 1);
        for (int x = 0; x < 4; ++x) q[13 + x] = static_cast<uint8_t>(num >> (24 - 8 * x));
        q += 17;
        if (blank) {
          std::fill(q, q + 4 * n, 0);
        } else {
          // Amplitude: scale x sqrt(taper power) x sqrt(reflectivity).
          const double daz = t - s.t0;
          const double a0 = p.scale * std::sqrt(burst_taper(i, lpb));
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
          Rng rng(o.seed * 0x100000001B3ULL ^ (static_cast<uint64_t>(k) << 40) ^
                  static_cast<uint64_t>(r));
          for (int x = 0; x < n; ++x) {
            double gi, gq;
            rng.gauss2(&gi, &gq);
            const uint16_t vi = static_cast<uint16_t>(quantise(amp[x] * gi));
            const uint16_t vq = static_cast<uint16_t>(quantise(amp[x] * gq));
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
  // Slots of the wide-swath sub-swaths carry their centre look angles; the
  // image-mode-only slots keep nominal values.
  const double nominal[8] = {16.628, 20.138, 0, 0, 0, 0, 38.058, 0};
  for (int k = 0; k < kSubSwaths; ++k)
    if (slot_of(k) == slot) return s.ss[k].elev_centre;
  return nominal[slot];
}

bool write_xca(const Scene& s, std::string* error) {
  Bytes r(kXcaSize, 0);
  put_mjd(r, 0, s.xca_start);
  put_u32(r, 12, kXcaSize);
  put_f32(r, 744, 4.5e5f);  // ws_hh
  put_f32(r, 748, 4.6e5f);  // ws_vv
  put_f32(r, 26520, 4.5e5f);
  put_f32(r, 26524, 4.6e5f);
  for (int slot = 0; slot < 8; ++slot) {
    put_f32(r, 760 + 4 * slot, static_cast<float>(ref_angle(s, slot)));
    for (int pol = 0; pol < 4; ++pol)
      for (int i = 0; i < 201; ++i)
        put_f32(r, 792 + (pol + 4 * slot) * 804 + 4 * i,
                static_cast<float>(xca_pattern_db(slot, (i - 100) * 0.05)));
  }
  return write_single_record_file(s, s.xca_name, "AUX XCA FILE", r, error);
}

bool write_ins(const Scene& s, std::string* error) {
  Bytes r(kInsSize, 0);
  put_mjd(r, 0, s.xca_start);
  put_u32(r, 12, kInsSize);
  put_f32(r, 16, static_cast<float>(s.fc));
  put_f32(r, 20, static_cast<float>(s.fs));
  put_f32(r, 24, 0.0f);
  for (int slot = 0; slot < 8; ++slot)
    put_f32(r, 161920 + 4 * slot, static_cast<float>(ref_angle(s, slot)));
  for (int mode = 0; mode < 5; ++mode) {
    const size_t o = 171232 + 68 * mode;
    put_f32(r, o, static_cast<float>(s.temperature + (mode - 2)));
    for (int i = 0; i < 8; ++i) put_f64(r, o + 4 + 8 * i, s.droop[i] - 0.001 * (mode - 2));
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
  off += kSubSwaths * kSqSize;
  L.mpp_offset = off;
  off += kSubSwaths * kMppSize;
  L.dop_offset = off;
  L.dop_records = static_cast<int>(s.dop_times.size());
  off += static_cast<int64_t>(L.dop_records) * kDopSize;
  L.chirp_offset = off;
  off += kSubSwaths * kChirpSize;
  L.ant_offset = off;
  off += kSubSwaths * kAntSize;
  L.geo_offset = off;
  L.geo_step = 5 * s.cycle_lines;
  L.geo_segments = (s.grid_lines - 1 + L.geo_step - 1) / L.geo_step;
  L.geo_records = L.geo_segments * kSubSwaths;
  off += static_cast<int64_t>(L.geo_records) * kGeoSize;
  const int nmds = std::max(0, std::min(s.opt.mds_count, kSubSwaths));
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
