// The truth file: what a correct reader of the generated files must find.
//
// Parameter-file form ([Section] then "Key = value" lines), readable by the
// profile library and by a person.  Text before the first section is a
// comment.  Times are seconds since 1985-01-01 00:00:00 (every day 86400 s)
// with their UTC texts beside them (key + "Text"); range times are two-way
// delays in seconds; angles and coordinates are degrees (geodetic WGS84);
// frequencies and bandwidths Hz.
//
// [Scene]
//   Product, OrbitFile, OrbitSource, XcaFile, InsFile, AuxList, Size, Seed
//   ProductType                 WSS, IMS or APS (characters 4 to 6 of Product)
//   SensingStart, SensingStop   earliest first line and latest last line of
//                               all images (also the SPH line times)
//   Pass, AbsOrbit, RelOrbit
//   Polarisation                that of the first image (SPH MDS1_TX_RX_POLAR)
//   SubSwaths                   WSS: number of MDS written
//   Images                      IMS, APS: number of MDS written (1, 2)
//   Swath, Descriptor           IMS, APS: SPH swath ("IS2") and descriptor
//   LineTimeInterval            interval of the lines inside a burst (WSS), of
//                               all lines (IMS, APS; as the SPH states it)
//   BurstCycle                  WSS: sum over sub-swaths of (Rank + EchoesPerBurst) / PRF
//   RangeSamplingRate, CarrierFrequency, RangeSpacing, AzimuthSpacing, TotalSize
//   CentreTime, CentreRangeTime middle of SensingStart and SensingStop, and of
//                               the near range of the first image and the far
//                               range of the last
//   CentreLat, CentreLon, CentreHeading   the ground point there and the
//                               heading (below)
//   SphFirstNearLat/Lon ... SphLastFarLat/Lon   the six product corners of the
//                               SPH (First/Last line; Near of SS1, Mid, Far of SS5;
//                               IMS, APS: near, mid and far of the image)
// [SubSwathK], K = 1..5: the sub-swaths of a WSS product
// [ImageK], K = 1..Images: the images of an IMS or APS product (MDS K), with
//   the keys below that do not concern bursts or sub-swaths (no
//   LinesPerBurst, Bursts, EchoesPerBurst, Rank, BurstCycle,
//   NearRangeOffsetSamples, DopplerDelta), and
//   Polarisation                "H/H", "V/V", "H/V", "V/H" (SPH MDSK_TX_RX_POLAR)
//   Swath                       the swath of the image, "IS2"
//   Records are one LineTimeInterval apart: record r at FirstLineTime +
//   r LineTimeInterval (whole us).  The images of an APS product cover the
//   same lines and ranges and share one geolocation grid.
//   Samples, Records, LinesPerBurst (L), Bursts, EchoesPerBurst, Rank, PRF,
//   BurstCycle                  as in [Scene]
//   PulseLength, PulseBandwidth chirp length (s) and bandwidth
//   RangeLookBandwidth          range look bandwidth (slot K of its array; the
//                               first slot for every image of IMS, APS)
//   RangeSpectrumBandwidth      two-sided bandwidth of the samples' range
//                               spectrum (the sampling rate unless band-limited)
//   FirstLineTime               first line of the first burst (record 0)
//   LastLineTime                last line of the last burst (last record);
//                               record r is line r mod L of burst r / L at
//                               FirstLineTime + (r / L) BurstCycle
//                               + (r mod L) LineTimeInterval (whole us)
//   TimeDiffZeroDoppler         float32 value stored beside the first time
//   AcquisitionStartTime        FirstLineTime + TimeDiffZeroDoppler
//   NearRangeTime, FarRangeTime range times of the first and last sample
//   NearRangeOffsetSamples      (NearRangeTime - that of SS1) x sampling rate
//   RangeSpacing                metres per sample
//   FirstTieSample              sample number of the first grid tie point
//   CentreTime, CentreRangeTime middle of the first/last lines and near/far
//   Near/Centre/FarIncidence, CentreLookAngle
//   XcaSlot                     slot of the image's patterns in the
//                               calibration files ([Calibration])
//   CentreHeading               direction of the Earth-fixed satellite velocity
//                               at CentreTime in the horizontal plane of the
//                               centre's ground point, degrees clockwise from
//                               north (0..360)
//   FirstNear/FirstFar/LastNear/LastFar/Centre Lat and Lon
//   HeaderCentreTime, HeaderCentreRangeTime, HeaderCentreLat/Lon
//                               a centre by the approximate rule: the middle
//                               sample (half the samples rounded up), and
//                               half the bursts' cycles after the first line
//                               (image products: the middle line); the
//                               image's own middle is Centre*
//   MdsOffset, RecordSize
//   RangeWindowType, RangeWindowCoefficient, AzimuthWindowType,
//   AzimuthWindowCoefficient, AzimuthLookBandwidth
//   ProcessorGain, ExternalCalibrationFactor, NoisePower
//   ChirpPower                  chirp power of the sub-swath's (image's) chirp record
//   DopplerDelta                its int16 added to the Doppler constant term
//   DopplerRecordJ              "time c0 c1 c2 c3 c4" of Doppler record J with
//                               the delta added: f = sum ci (tau - DopplerRangeTime)^i
//                               (images: the record's own coefficients)
//   DopplerRangeTime            reference range time of the Doppler polynomials
//   FmRateC0, FmRateC1, FmRateC2, FmRateRangeTime
//                               azimuth FM rate C0 + C1 r + C2 r^2 (Hz/s),
//                               r = tau - FmRateRangeTime, at CentreTime
//   MeanPower                   expected |I + jQ|^2 averaged over the
//                               sub-swath (uniform and flat patterns only)
// [Pattern]     reflectivity pattern and how samples were made from it
// [Doppler]     the Doppler centroid records without the sub-swath deltas
// [Calibration] elevation patterns, reference angles, droop gains
// [Defects]     the defects written on request
#include <algorithm>
#include <cctype>
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
const char* kImageHeader =
    "Ground truth of a generated ENVISAT ASAR image-mode scene.\n"
    "Times: seconds since 01-JAN-1985 00:00:00 (86400 s a day), UTC text beside.\n"
    "Range times: two-way delay in seconds. Angles, latitudes, longitudes: degrees (WGS84).\n"
    "Corners are the zero-Doppler ground points of the first/last line at the near/far\n"
    "range of each image; the centre is at CentreTime and CentreRangeTime.\n";

}  // namespace

bool write_truth(const Scene& s, const ProductLayout& L, std::string* error) {
  const bool wss = s.wide_swath;
  Truth t;
  t.comment(wss ? kHeader : kImageHeader);
  t.section("Scene");
  t.text("Product", s.product_name);
  t.text("ProductType", s.product_type);
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
  if (wss) {
    t.integer("SubSwaths", mds_written(s));
  } else {
    t.integer("Images", mds_written(s));
    t.text("Swath", s.swath);
    t.text("Descriptor", s.descriptor);
  }
  t.num("LineTimeInterval", s.line_interval, "%.12e");
  if (wss) t.num("BurstCycle", s.burst_cycle, "%.12e");
  t.num("RangeSamplingRate", s.fs, "%.3f");
  t.num("CarrierFrequency", s.fc, "%.3f");
  t.num("RangeSpacing", s.range_spacing, "%.9f");
  t.num("AzimuthSpacing", s.azimuth_spacing, "%.6f");
  t.integer("TotalSize", L.tot_size);
  t.time("CentreTime", s.centre.t);
  t.num("CentreRangeTime", s.centre.tau, "%.15e");
  t.num("CentreLat", s.centre.lat, "%.7f");
  t.num("CentreLon", s.centre.lon, "%.7f");
  t.num("CentreHeading", s.centre.heading, "%.6f");
  const char* sph[6] = {"FirstNear", "FirstMid", "FirstFar", "LastNear", "LastMid", "LastFar"};
  for (int i = 0; i < 6; ++i) {
    t.num(std::string("Sph") + sph[i] + "Lat", s.sph_lat[i], "%.7f");
    t.num(std::string("Sph") + sph[i] + "Lon", s.sph_lon[i], "%.7f");
  }

  for (int k = 0; k < s.images; ++k) {
    const SubSwath& w = s.ss[k];
    t.section((wss ? "SubSwath" : "Image") + std::to_string(k + 1));
    t.integer("Samples", w.samples);
    t.integer("Records", w.records);
    if (wss) {
      t.integer("LinesPerBurst", w.lines_per_burst);
      t.integer("Bursts", w.bursts);
      t.integer("EchoesPerBurst", w.echoes);
      t.integer("Rank", w.rank);
    } else {
      t.text("Polarisation", w.polar);
      t.text("Swath", w.beam);
    }
    t.num("PRF", w.prf, "%.6f");
    if (wss) t.num("BurstCycle", s.burst_cycle, "%.12e");
    t.num("PulseLength", w.pulse_len, "%.9e");
    t.num("PulseBandwidth", w.pulse_bw, "%.3f");
    t.num("RangeLookBandwidth", w.look_bw, "%.3f");
    t.num("RangeSpectrumBandwidth", w.band, "%.3f");
    t.time("FirstLineTime", w.first_time);
    t.time("LastLineTime", w.last_time);
    t.num("TimeDiffZeroDoppler", w.time_diff, "%.9f");
    t.time("AcquisitionStartTime", w.first_time + static_cast<double>(w.time_diff));
    t.num("NearRangeTime", w.near_tau, "%.15e");
    t.num("FarRangeTime", w.far_tau, "%.15e");
    if (wss) t.num("NearRangeOffsetSamples", (w.near_tau - s.ss[0].near_tau) * s.fs, "%.6f");
    t.num("RangeSpacing", s.range_spacing, "%.9f");
    t.integer("FirstTieSample", s.opt.first_tie_sample);
    t.time("CentreTime", w.centre.t);
    t.num("CentreRangeTime", w.centre.tau, "%.15e");
    t.num("NearIncidence", w.first_near.incidence, "%.6f");
    t.num("CentreIncidence", w.centre.incidence, "%.6f");
    t.num("FarIncidence", w.first_far.incidence, "%.6f");
    t.num("CentreLookAngle", w.centre.look, "%.6f");
    t.num("CentreHeading", w.centre.heading, "%.6f");
    t.integer("XcaSlot", w.xca_slot);
    const Corner* c[5] = {&w.first_near, &w.first_far, &w.last_near, &w.last_far, &w.centre};
    const char* n[5] = {"FirstNear", "FirstFar", "LastNear", "LastFar", "Centre"};
    for (int i = 0; i < 5; ++i) {
      t.num(std::string(n[i]) + "Lat", c[i]->lat, "%.7f");
      t.num(std::string(n[i]) + "Lon", c[i]->lon, "%.7f");
    }
    t.time("HeaderCentreTime", w.header_centre.t);
    t.num("HeaderCentreRangeTime", w.header_centre.tau, "%.15e");
    t.num("HeaderCentreLat", w.header_centre.lat, "%.7f");
    t.num("HeaderCentreLon", w.header_centre.lon, "%.7f");
    t.integer("MdsOffset", L.mds_offset[k]);
    t.integer("RecordSize", w.record_size);
    t.text("RangeWindowType", "HAMMING");
    t.num("RangeWindowCoefficient", w.rg_window_coef, "%.6f");
    t.text("AzimuthWindowType", "HAMMING");
    t.num("AzimuthWindowCoefficient", w.az_window_coef, "%.6f");
    t.num("AzimuthLookBandwidth", w.az_look_bw, "%.3f");
    t.num("ProcessorGain", w.proc_gain, "%.6f");
    t.num("ExternalCalibrationFactor", w.ext_cal, "%.3f");
    t.num("NoisePower", w.noise, "%.6f");
    t.num("ChirpPower", w.chirp_power, "%.6f");
    if (wss) t.integer("DopplerDelta", w.dop_delta);
    t.num("DopplerRangeTime", s.dop_ref_tau, "%.15e");
    for (size_t j = 0; j < s.dop_times.size(); ++j) {
      char b[160];
      std::snprintf(b, sizeof b, "%.6f %.6f %.6e 0 0 0", s.dop_times[j], s.dop_c0[j] + w.dop_delta,
                    s.dop_c1);
      t.text("DopplerRecord" + std::to_string(j), b);
    }
    t.num("FmRateC0", w.fm_rate[0], "%.9e");
    t.num("FmRateC1", w.fm_rate[1], "%.9e");
    t.num("FmRateC2", w.fm_rate[2], "%.9e");
    t.num("FmRateRangeTime", w.fm_origin_tau, "%.15e");
    if (w.mean_power > 0) t.num("MeanPower", w.mean_power, "%.6f");
  }

  const Pattern& p = s.pattern;
  t.section("Pattern");
  t.text("Kind", p.kind);
  t.text("Coordinates",
         std::string("daz = zero-Doppler time - SensingStart (s); drg = range time - "
                     "NearRangeTime of ") +
             (wss ? "SS1 (s)" : "Image1 (s)"));
  t.text("Samples",
         "I and Q normal, std dev Scale * sqrt(Taper(i)) * sqrt(R(daz, drg)), "
         "rounded to int16; i = line within its burst (0..LinesPerBurst-1)");
  t.text("Taper", p.tapered ? "sin^2(pi * (i + 0.5) / LinesPerBurst) (power); the about three "
                              "bursts covering a time sum to about 1.5"
                            : "none (1 on every line)");
  t.text("BandLimit", s.opt.band_limit
                          ? "yes: white inside |f| <= RangeSpectrumBandwidth / 2 of each "
                            "line's DFT, zero outside (before R and the taper)"
                          : "no: white over the sampling rate");
  t.num("Scale", p.scale, "%.3f");
  t.text("ElevationGain", "none (the data carry no elevation antenna pattern)");
  if (p.kind == "flat" || p.kind == "uniform") t.text("Definition", "R = 1");
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
  t.text("Polynomial", wss ? "f = C0 + C1 * (range time - ReferenceRangeTime) + DopplerDelta of "
                             "the sub-swath (see DopplerRecordJ of each sub-swath)"
                           : "f = C0 + C1 * (range time - ReferenceRangeTime), the same for "
                             "every image");
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
  t.text("ProductPattern",
         "the product's antenna elevation pattern record of each image holds G of its "
         "XcaSlot at the look angles of its 11 tie ranges at CentreTime, offsets from its "
         "ReferenceAngle (= CentreLookAngle)");
  if (wss) {
    t.text("Slots", "SS1 -> 7 (ss1), SS2..SS5 -> 2..5 (is3_ss2..is6_ss5)");
    for (int k = 0; k < kSubSwaths; ++k)
      t.num("ReferenceAngleSS" + std::to_string(k + 1), s.ss[k].elev_centre, "%.6f");
  } else {
    std::string slot_name = s.swath;
    for (char& c : slot_name) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    t.text("Slots", s.swath + " -> " + std::to_string(s.ss[0].xca_slot) + " (" + slot_name + ")");
    t.num("ReferenceAngle" + s.swath, s.ss[0].elev_centre, "%.6f");
  }
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
  t.text("BlankTimes", s.opt.blank_zero_time ? "zero" : "kept");
  t.integer("MdsCount", mds_written(s));
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
