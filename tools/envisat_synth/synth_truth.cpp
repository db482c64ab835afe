// The truth file: what a correct reader of the generated files must find.
//
// Parameter-file form ([Section] then "Key = value" lines), readable by the
// profile library and by a person.  Text before the first section is a
// comment.  Times are seconds since 1985-01-01 00:00:00 (every day 86400 s)
// with their UTC texts beside them; range times are two-way delays in
// seconds; angles and coordinates are degrees (geodetic WGS84).
//
//   [Scene]       file names, orbit source, sensing start/stop, pass,
//                 polarisation, orbits, line interval, burst cycle and its
//                 lines, lines per burst, bursts, sampling and carrier
//                 frequencies, spacings, time offset of the processing record
//   [SubSwathK]   K = 1..5: Samples, Records, LinesPerBurst, Bursts,
//                 EchoesPerBurst, Rank, PRF, FirstLineTime, LastLineTime,
//                 NearRangeTime, FarRangeTime, CentreTime, CentreRangeTime,
//                 Near/Centre/FarIncidence, CentreLookAngle, the corners
//                 FirstNear/FirstFar/LastNear/LastFar Lat and Lon, CentreLat,
//                 CentreLon, MdsOffset, RecordSize, ChirpPower, DopplerDelta,
//                 azimuth FM-rate coefficients
//   [Pattern]     reflectivity pattern and how samples were made from it
//   [Doppler]     Doppler centroid records
//   [Calibration] elevation patterns, reference angles, droop gains
//   [Defects]     the defects written on request
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string>

#include "synth_format.h"
#include "synth_writer.h"

namespace synth {
namespace {

class Truth {
 public:
  void section(const std::string& name) { t_ += "\n[" + name + "]\n"; }
  void text(const std::string& key, const std::string& v) { t_ += key + " = " + v + "\n"; }
  void num(const std::string& key, double v, const char* fmt = "%.9f") {
    char b[64];
    std::snprintf(b, sizeof b, fmt, v);
    text(key, b);
  }
  void integer(const std::string& key, long long v) { text(key, std::to_string(v)); }
  void time(const std::string& key, double t) {
    num(key, t);
    text(key + "Text", format_utc(t));
  }
  void comment(const std::string& c) { t_ += c; }
  const std::string& str() const { return t_; }

 private:
  std::string t_;
};

const char* kHeader =
    "Ground truth of a generated ENVISAT ASAR wide-swath scene.\n"
    "Times: seconds since 01-JAN-1985 00:00:00 (86400 s a day), UTC text beside.\n"
    "Range times: two-way delay in seconds. Angles, latitudes, longitudes: degrees (WGS84).\n"
    "Corners are the zero-Doppler ground points of the first/last line at the near/far\n"
    "range of each sub-swath; the centre is at CentreTime and CentreRangeTime.\n";

}  // namespace

bool write_truth(const Scene& s, const ProductLayout& L, std::string* error) {
  Truth t;
  t.comment(kHeader);
  t.section("Scene");
  t.text("Product", s.product_name);
  t.text("OrbitFile", s.orbit_name);
  t.text("OrbitSource", s.kepler ? "kepler" : "real DORIS file " + s.orbit_source);
  t.text("XcaFile", s.xca_name);
  t.text("InsFile", s.ins_name);
  t.text("AuxList", "ASA_AUX_list.dat");
  t.text("Size", s.opt.size);
  t.integer("Seed", static_cast<long long>(s.opt.seed));
  t.time("SensingStart", s.t0);
  t.time("SensingStop", s.stop);
  t.text("Pass", s.pass);
  t.text("Polarisation", s.polar);
  t.integer("AbsOrbit", s.abs_orbit);
  t.integer("RelOrbit", s.rel_orbit);
  t.integer("SubSwaths", std::max(0, std::min(s.opt.mds_count, kSubSwaths)));
  t.num("LineTimeInterval", s.line_interval, "%.12e");
  t.num("BurstCycle", s.burst_cycle, "%.12e");
  t.integer("BurstCycleLines", s.cycle_lines);
  t.integer("LinesPerBurst", s.lines_per_burst);
  t.integer("Bursts", s.bursts);
  t.integer("GridLines", s.grid_lines);
  t.num("RangeSamplingRate", s.fs, "%.3f");
  t.num("CarrierFrequency", s.fc, "%.3f");
  t.num("RangeSpacing", s.range_spacing, "%.9f");
  t.num("AzimuthSpacing", s.azimuth_spacing, "%.6f");
  t.num("TimeDiffZeroDoppler", s.time_diff_zd, "%.6f");
  t.integer("TotalSize", L.tot_size);

  for (int k = 0; k < kSubSwaths; ++k) {
    const SubSwath& w = s.ss[k];
    t.section("SubSwath" + std::to_string(k + 1));
    t.integer("Samples", w.samples);
    t.integer("Records", w.records);
    t.integer("LinesPerBurst", s.lines_per_burst);
    t.integer("Bursts", s.bursts);
    t.integer("EchoesPerBurst", w.echoes);
    t.integer("Rank", w.rank);
    t.num("PRF", w.prf, "%.6f");
    t.num("PulseLength", w.pulse_len, "%.9e");
    t.num("PulseBandwidth", w.pulse_bw, "%.3f");
    t.time("FirstLineTime", w.first_time);
    t.time("LastLineTime", w.last_time);
    t.num("NearRangeTime", w.near_tau, "%.12e");
    t.num("FarRangeTime", w.far_tau, "%.12e");
    t.time("CentreTime", w.centre.t);
    t.num("CentreRangeTime", w.centre.tau, "%.12e");
    t.num("NearIncidence", w.first_near.incidence, "%.6f");
    t.num("CentreIncidence", w.centre.incidence, "%.6f");
    t.num("FarIncidence", w.first_far.incidence, "%.6f");
    t.num("CentreLookAngle", w.centre.look, "%.6f");
    const Corner* c[5] = {&w.first_near, &w.first_far, &w.last_near, &w.last_far, &w.centre};
    const char* n[5] = {"FirstNear", "FirstFar", "LastNear", "LastFar", "Centre"};
    for (int i = 0; i < 5; ++i) {
      t.num(std::string(n[i]) + "Lat", c[i]->lat, "%.7f");
      t.num(std::string(n[i]) + "Lon", c[i]->lon, "%.7f");
    }
    t.integer("MdsOffset", L.mds_offset[k]);
    t.integer("RecordSize", w.record_size);
    t.num("ChirpPower", w.chirp_power, "%.6f");
    t.integer("DopplerDelta", w.dop_delta);
    t.num("FmRateC0", w.fm_rate[0], "%.6e");
    t.num("FmRateC1", w.fm_rate[1], "%.6e");
    t.num("FmRateC2", w.fm_rate[2], "%.6e");
    t.num("FmRateRangeTime", w.fm_origin_tau, "%.12e");
  }

  const Pattern& p = s.pattern;
  t.section("Pattern");
  t.text("Kind", p.kind);
  t.text("Coordinates",
         "daz = zero-Doppler time - SensingStart (s); drg = range time - NearRangeTime of SS1 (s)");
  t.text("Samples",
         "I and Q independent normal, std dev Scale * sqrt(Taper(i)) * sqrt(R(daz, drg)), "
         "rounded to int16; i = line within its burst (0..LinesPerBurst-1)");
  t.text("Taper",
         "sin^2(pi * (i + 0.5) / LinesPerBurst) (power); the three bursts covering a "
         "time sum to 1.5");
  t.num("Scale", p.scale, "%.3f");
  t.text("ElevationGain", "none (the data carry no elevation antenna pattern)");
  if (p.kind == "flat") t.text("Definition", "R = 1");
  if (p.kind == "checkerboard") {
    t.text("Definition", "R = High when floor(daz/AzCell) + floor(drg/RgCell) is even, else Low");
    t.num("AzCell", p.az_cell, "%.12e");
    t.num("RgCell", p.rg_cell, "%.12e");
    t.num("High", p.high, "%.3f");
    t.num("Low", p.low, "%.3f");
  }
  if (p.kind == "points") {
    t.text("Definition",
           "R = TargetLevel where |daz - T| <= HalfAz and |drg - Tau| <= HalfRg for "
           "a target, else Background");
    t.num("Background", p.background, "%.3f");
    t.num("TargetLevel", p.target_level, "%.3f");
    t.num("HalfAz", p.target_half_az, "%.12e");
    t.num("HalfRg", p.target_half_rg, "%.12e");
    t.integer("Targets", static_cast<long long>(p.targets.size()));
    for (size_t i = 0; i < p.targets.size(); ++i) {
      char b[160];
      std::snprintf(b, sizeof b, "%.6f %.12e %.7f %.7f", p.targets[i].t, p.targets[i].tau,
                    p.targets[i].lat, p.targets[i].lon);
      t.text("Target" + std::to_string(i), b);
    }
    t.text("TargetFormat", "daz drg lat lon");
  }

  t.section("Doppler");
  t.integer("Records", static_cast<long long>(s.dop_times.size()));
  t.num("ReferenceRangeTime", s.dop_ref_tau, "%.12e");
  t.text("Polynomial",
         "f = C0 + C1 * (range time - ReferenceRangeTime) + DopplerDelta of the "
         "sub-swath");
  t.num("C1", s.dop_c1, "%.6e");
  for (size_t j = 0; j < s.dop_times.size(); ++j) {
    char b[96];
    std::snprintf(b, sizeof b, "%.6f %.3f", s.dop_times[j], s.dop_c0[j]);
    t.text("Record" + std::to_string(j), b);
  }

  t.section("Calibration");
  t.text("PatternDb",
         "G(offset) = -(0.75 + 0.05 * slot) * offset^2 (two-way dB, offset in "
         "degrees from the reference angle; all polarisations)");
  t.text("Slots", "SS1 -> 7 (ss1), SS2..SS5 -> 2..5 (is3_ss2..is6_ss5)");
  for (int k = 0; k < kSubSwaths; ++k)
    t.num("ReferenceAngleSS" + std::to_string(k + 1), s.ss[k].elev_centre, "%.6f");
  t.num("Temperature", s.temperature + 0.0, "%.3f");
  std::string droop;
  for (int i = 0; i < 8; ++i) droop += (i ? " " : "") + std::to_string(s.droop[i]);
  t.text("DroopGain", "{" + droop + "}");
  t.text("DroopNote",
         "values of mode 2 (wide swath); mode m has Temperature + (m - 2) and "
         "DroopGain - 0.001 * (m - 2)");

  t.section("Defects");
  t.integer("BlankFirst", s.opt.blank_first);
  t.integer("BlankLast", s.opt.blank_last);
  t.integer("MdsCount", std::max(0, std::min(s.opt.mds_count, kSubSwaths)));
  t.integer("TruncateAt", s.opt.truncate_at);
  t.integer("DsdBeyondEnd", s.opt.dsd_beyond_end);
  t.integer("ZeroCountDsd", s.opt.zero_count);
  t.text("WrongType", s.opt.wrong_type.empty() ? "none" : s.opt.wrong_type);

  std::string dir = s.opt.out_dir;
  if (!dir.empty() && dir.back() != '/') dir += '/';
  const std::string path = dir + "synth_truth.txt";
  std::FILE* f = std::fopen(path.c_str(), "wb");
  if (!f) {
    *error = "cannot create " + path;
    return false;
  }
  const bool ok = std::fwrite(t.str().data(), 1, t.str().size(), f) == t.str().size();
  if (std::fclose(f) != 0 || !ok) {
    *error = "write failed: " + path;
    return false;
  }
  return true;
}

}  // namespace synth
