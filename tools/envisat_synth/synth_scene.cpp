#include "synth_scene.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>

#include "synth_time.h"

namespace synth {
namespace {

constexpr double kDeg = M_PI / 180.0;

// Wide-swath beam parameters (SS1..SS5) in the ranges of real acquisitions.
// Every beam differs from the others in every value, so that a value taken
// from the wrong beam is a wrong value.
const double kPrf[kSubSwaths] = {1712.0, 2095.0, 1675.0, 1886.0, 1980.0};
const int kRank[kSubSwaths] = {9, 12, 10, 11, 13};
const int kEchoes[kSubSwaths] = {64, 78, 63, 71, 66};
// About three burst cycles of lines per burst: each time lies in three bursts.
const int kLinesPerBurst[kSubSwaths] = {54, 56, 53, 55, 52};
const double kPulseLen[kSubSwaths] = {27.1e-6, 24.6e-6, 26.3e-6, 22.8e-6, 25.0e-6};
const double kPulseBw[kSubSwaths] = {16.0e6, 13.6e6, 12.9e6, 11.7e6, 9.6e6};
const double kLookBw[kSubSwaths] = {15.2e6, 12.9e6, 12.3e6, 11.1e6, 9.1e6};
const double kRealNearTau[kSubSwaths] = {5.48e-3, 5.79e-3, 6.03e-3, 6.32e-3, 6.56e-3};
const int kRealSamples[kSubSwaths] = {6300, 5100, 6200, 5000, 6000};
const int kDopDelta[kSubSwaths] = {11, -6, 4, 9, -7};
const double kChirpPower[kSubSwaths] = {1.13, 0.94, 1.07, 0.88, 1.21};
const float kTimeDiff[kSubSwaths] = {-0.351f, -0.338f, -0.362f, -0.344f, -0.357f};
// First line of each beam, as a fraction of the burst cycle after the earliest.
// The order in time (SS2, SS3, SS5, SS1, SS4) puts no beam's first geolocation
// record at its own index in the table.
const double kFirstOffset[kSubSwaths] = {0.57, 0.0, 0.19, 0.78, 0.36};
// Part of a sample by which each beam's near range falls short of a whole
// sample count after the previous one (compressed layouts).
const double kNearFraction[kSubSwaths - 1] = {0.37, 0.32, 0.54, 0.33};
const double kRgWindowCoef[kSubSwaths] = {0.75, 0.70, 0.72, 0.68, 0.74};
const double kAzWindowCoef[kSubSwaths] = {0.75, 0.72, 0.70, 0.73, 0.71};
const double kAzLookBw[kSubSwaths] = {1040.0, 1260.0, 1010.0, 1140.0, 1190.0};
const double kProcGain[kSubSwaths] = {1.0, 1.02, 0.98, 1.05, 0.96};
constexpr double kLineInterval = 0.01172;  // s
constexpr int kGeoStepLines = 90;          // geolocation grid lines 90 line intervals apart

// Image-mode images: swath IS2 (incidence about 19 to 27 degrees), one look,
// lines one pulse repetition interval apart.  The second image of an
// alternating-polarisation product (cross-polarised) has its own calibration
// and noise values; geometry and processing are those of the first.
constexpr double kImagePrf = 1652.415692;  // Hz
constexpr double kImagePulseLen = 27.12e-6, kImagePulseBw = 16.0e6, kImageLookBw = 15.55e6;
constexpr double kImageNearTau = 5.57e-3;  // s
constexpr int kImageRank = 9;
constexpr int kImageXcaSlot = 1;  // is2
constexpr double kImageAzLookBw = 1316.0, kImageWindowCoef = 0.75;
const float kImageTimeDiff[2] = {-0.3296f, -0.3301f};
const double kImageChirpPower[2] = {1.04, 0.91};
const double kImageExtCal[2] = {1.05e5, 1.18e5};
const double kImageNoise[2] = {2.1, 1.45};
const double kImageProcGain[2] = {1.0, 1.0};

struct SizePlan {
  int samples[kSubSwaths];  // per sub-swath, 0 for the real counts
  int overlap;              // samples shared by neighbours when the layout is compressed
  int bursts;
  int checker_az, checker_rg;
  int targets_az, targets_rg;
};

bool plan_for(const std::string& size, SizePlan* p) {
  if (size == "tiny")
    *p = {{128, 112, 136, 104, 120}, 16, 4, 3, 8, 2, 4};
  else if (size == "small")
    *p = {{320, 288, 352, 272, 304}, 32, 30, 6, 12, 4, 8};
  else if (size == "realistic")
    *p = {{0, 0, 0, 0, 0}, 0, 282, 12, 15, 8, 20};
  else
    return false;
  return true;
}

// Image-mode sizes: one image of `samples` x `lines`, grid lines `geo_step`
// line intervals apart.
struct ImagePlan {
  int samples, lines, geo_step;
  int checker_az, checker_rg;
  int targets_az, targets_rg;
};

bool image_plan_for(const std::string& size, ImagePlan* p) {
  if (size == "tiny")
    *p = {232, 320, 64, 3, 4, 2, 3};
  else if (size == "small")
    *p = {480, 960, 96, 6, 6, 4, 4};
  else if (size == "realistic")
    *p = {5174, 26000, 1300, 12, 10, 8, 10};
  else
    return false;
  return true;
}

// The line interval as the SPH states it ("%+.8e"), so that the times of the
// records are exactly those a reader computes from the header.
double stated_interval(double prf) {
  char buf[32];
  std::snprintf(buf, sizeof buf, "%+.8e", 1.0 / prf);
  return std::strtod(buf, nullptr);
}

std::string crossed(const std::string& polar) {
  return polar.substr(0, 2) + (polar[0] == 'H' ? "V" : "H");
}

State state_at(const Scene& s, double t) {
  return s.traj->at(t);
}

// Heading of the velocity v in the horizontal plane at geodetic latitude and
// longitude (degrees): clockwise from north, 0..360.
double heading_deg(Vec3 v, double lat_deg, double lon_deg) {
  const double phi = lat_deg * M_PI / 180.0, lam = lon_deg * M_PI / 180.0;
  const Vec3 east{-std::sin(lam), std::cos(lam), 0.0};
  const Vec3 north{-std::sin(phi) * std::cos(lam), -std::sin(phi) * std::sin(lam), std::cos(phi)};
  const double h = std::atan2(dot(v, east), dot(v, north)) * 180.0 / M_PI;
  return h < 0.0 ? h + 360.0 : h;
}

bool corner(const Scene& s, double t, double tau, Corner* c) {
  const State st = state_at(s, t);
  GroundPoint g;
  if (!zero_doppler_point(st, tau, &g)) return false;
  c->t = t;
  c->tau = tau;
  c->lat = g.geo.lat_deg;
  c->lon = g.geo.lon_deg;
  c->incidence = g.incidence_deg;
  c->look = g.look_deg;
  c->heading = heading_deg(st.v, c->lat, c->lon);
  return true;
}

double geodetic_lat(const Trajectory& tr, double t) {
  return to_geodetic(tr.at(t).p).lat_deg;
}

// First time after `from` when the sub-satellite latitude passes `lat` going
// north (ascending) or south.  Whole seconds.
bool find_crossing(const Trajectory& tr, double from, double to, double lat, bool ascending,
                   double* t) {
  double prev = geodetic_lat(tr, from);
  for (double x = from + 1.0; x <= to; x += 1.0) {
    const double cur = geodetic_lat(tr, x);
    if (ascending ? (prev < lat && cur >= lat) : (prev > lat && cur <= lat)) {
      *t = x;
      return true;
    }
    prev = cur;
  }
  return false;
}

// Azimuth FM rate at zero Doppler: the second time derivative of the range
// to a fixed ground point G is (|V|^2 + A.(P - G)) / R, so the rate is
// -(2 / lambda) (|V|^2 + A.(P - G)) / R with the Earth-fixed state P, V, A.
// Fitted over the sub-swath as c0 + c1 r + c2 r^2, r = tau - origin.
bool fit_fm_rate(const Scene& s, SubSwath* w) {
  const State st = s.traj->at(w->centre.t);
  const double lambda = kLightSpeed / s.fc;
  constexpr int kPoints = 21;
  const double span = w->far_tau - w->fm_origin_tau;
  // Normal equations in u = r / span, solved by Cramer's rule.
  double m[3][3] = {{0}}, rhs[3] = {0};
  for (int i = 0; i < kPoints; ++i) {
    const double tau = w->near_tau + (w->far_tau - w->near_tau) * i / (kPoints - 1);
    GroundPoint g;
    if (!zero_doppler_point(st, tau, &g)) return false;
    const Vec3 d = st.p - g.x;
    const double fm = -(2.0 / lambda) * (dot(st.v, st.v) + dot(st.a, d)) / norm(d);
    const double u = (tau - w->fm_origin_tau) / span;
    const double pw[3] = {1.0, u, u * u};
    for (int a = 0; a < 3; ++a) {
      rhs[a] += pw[a] * fm;
      for (int b = 0; b < 3; ++b) m[a][b] += pw[a] * pw[b];
    }
  }
  auto det3 = [](const double q[3][3]) {
    return q[0][0] * (q[1][1] * q[2][2] - q[1][2] * q[2][1]) -
           q[0][1] * (q[1][0] * q[2][2] - q[1][2] * q[2][0]) +
           q[0][2] * (q[1][0] * q[2][1] - q[1][1] * q[2][0]);
  };
  const double det = det3(m);
  if (det == 0.0) return false;
  double b[3];
  for (int c = 0; c < 3; ++c) {
    double q[3][3];
    for (int r = 0; r < 3; ++r)
      for (int k = 0; k < 3; ++k) q[r][k] = k == c ? rhs[r] : m[r][k];
    b[c] = det3(q) / det;
  }
  w->fm_rate[0] = b[0];
  w->fm_rate[1] = b[1] / span;
  w->fm_rate[2] = b[2] / (span * span);
  return true;
}

// Expected |sample|^2 of a sub-swath whose I and Q are normal with standard
// deviation scale * sqrt(taper) and rounded to integers (rounding adds 1/12
// to each variance).
double mean_power(const Pattern& p, const SubSwath& w) {
  double taper = 1.0;
  if (p.tapered) {
    taper = 0.0;
    for (int i = 0; i < w.lines_per_burst; ++i) taper += burst_taper(i, w.lines_per_burst);
    taper /= w.lines_per_burst;
  }
  return 2.0 * (p.scale * p.scale * taper + 1.0 / 12.0);
}

// Time and range of the centre by the approximate rule (see SubSwath).
double header_centre_time(const Scene& s, const SubSwath& w) {
  if (s.wide_swath && w.lines_per_burst > 0) {
    const double bursts = std::round(static_cast<double>(w.records) / w.lines_per_burst);
    return w.first_time + bursts * s.burst_cycle / 2;
  }
  return (w.first_time + w.last_time) / 2;
}
double header_centre_tau(const Scene& s, const SubSwath& w) {
  return w.near_tau + std::ceil(w.samples / 2.0) / s.fs;
}

// Corners, centre, reference look angle and FM rate of an image whose
// timing and range are set.
bool derive_geometry(const Scene& s, SubSwath* w, std::string* error) {
  const double tc = round_us((w->first_time + w->last_time) / 2);
  const double tauc = (w->near_tau + w->far_tau) / 2;
  if (!corner(s, w->first_time, w->near_tau, &w->first_near) ||
      !corner(s, w->first_time, w->far_tau, &w->first_far) ||
      !corner(s, w->last_time, w->near_tau, &w->last_near) ||
      !corner(s, w->last_time, w->far_tau, &w->last_far) || !corner(s, tc, tauc, &w->centre) ||
      !corner(s, header_centre_time(s, *w), header_centre_tau(s, *w), &w->header_centre)) {
    *error = "no ground intersection for the scene geometry";
    return false;
  }
  w->elev_centre = w->centre.look;
  w->fm_origin_tau = static_cast<float>(w->near_tau * 1e9) * 1e-9;
  if (!fit_fm_rate(s, w)) {
    *error = "no ground intersection for the azimuth FM rate";
    return false;
  }
  return true;
}

// Image k of an image-mode product: every image covers the same lines and
// ranges; the second is the cross-polarised one.
void set_image(const Scene& s, const ImagePlan& plan, int k, SubSwath* w) {
  w->beam = s.swath;
  w->polar = k == 0 ? s.polar : crossed(s.polar);
  w->xca_slot = kImageXcaSlot;
  w->prf = kImagePrf;
  w->rank = kImageRank;
  w->echoes = 0;
  w->pulse_len = kImagePulseLen;
  w->pulse_bw = kImagePulseBw;
  w->look_bw = kImageLookBw;
  w->samples = plan.samples;
  w->near_tau = kImageNearTau;
  w->far_tau = w->near_tau + (w->samples - 1) / s.fs;
  w->lines_per_burst = 0;
  w->bursts = 0;
  w->records = plan.lines;
  w->first_time = round_us(s.t0);
  w->last_time = record_time(s, *w, w->records - 1);
  w->time_diff = kImageTimeDiff[k];
  w->chirp_power = kImageChirpPower[k];
  w->dop_delta = 0;
  w->rg_window_coef = kImageWindowCoef;
  w->az_window_coef = kImageWindowCoef;
  w->az_look_bw = kImageAzLookBw;
  w->proc_gain = kImageProcGain[k];
  w->ext_cal = kImageExtCal[k];
  w->noise = kImageNoise[k];
  w->record_size = 17 + 4LL * w->samples;
  w->band = s.opt.band_limit ? w->pulse_bw : s.fs;
  const Pattern& p = s.pattern;
  w->mean_power = (p.kind == "uniform" || p.kind == "flat") ? mean_power(p, *w) : 0.0;
}

}  // namespace

double burst_taper(int i, int lines_per_burst) {
  const double s = std::sin(M_PI * (i + 0.5) / lines_per_burst);
  return s * s;
}

double xca_pattern_db(int slot, double offset_deg) {
  // A parabola in dB, 0 at the reference angle, a little narrower per slot.
  const double c = 0.75 + 0.05 * slot;  // dB per square degree
  return -c * offset_deg * offset_deg;
}

double Pattern::at(double daz, double drg) const {
  if (kind == "flat" || kind == "uniform") return 1.0;
  if (kind == "checkerboard") {
    const long a = static_cast<long>(std::floor(daz / az_cell));
    const long r = static_cast<long>(std::floor(drg / rg_cell));
    return ((a + r) % 2 == 0) ? high : low;
  }
  for (const Target& tg : targets)
    if (std::fabs(daz - tg.t) <= target_half_az && std::fabs(drg - tg.tau) <= target_half_rg)
      return target_level;
  return background;
}

double record_time(const Scene& s, const SubSwath& w, int r) {
  if (w.lines_per_burst <= 0) return round_us(w.first_time + r * s.line_interval);
  const int burst = r / w.lines_per_burst, line = r % w.lines_per_burst;
  return round_us(w.first_time + burst * s.burst_cycle + line * s.line_interval);
}

int mds_written(const Scene& s) {
  return s.opt.mds_count < 0 ? s.images : std::min(s.opt.mds_count, s.images);
}

bool build_scene(const Options& opt, Scene* s, std::string* error) {
  s->opt = opt;
  if (opt.product != "WSS" && opt.product != "IMS" && opt.product != "APS") {
    *error = "product must be WSS, IMS or APS";
    return false;
  }
  s->product_type = opt.product;
  s->wide_swath = opt.product == "WSS";
  s->images = s->wide_swath ? kSubSwaths : (opt.product == "APS" ? 2 : 1);
  if (!s->wide_swath) {
    s->swath = "IS2";
    s->descriptor = opt.product == "APS" ? "AP Mode SLC Image" : "Image Mode SLC Image";
    s->algorithm = "RAN/DOP";
    if (opt.mds_count >= 0) {
      *error = "--mds-count applies to WSS products only";
      return false;
    }
  }
  // Annotation descriptors: 0..6 in the wide-swath layout, 0..9 (up to the
  // map projection descriptor) in the image-mode layout.
  const int last_annotation = s->wide_swath ? 6 : 9;
  if (opt.zero_count > last_annotation) {
    *error = "--zero-count names an annotation descriptor: 0.." + std::to_string(last_annotation) +
             " for " + opt.product;
    return false;
  }
  SizePlan plan;
  ImagePlan iplan;
  if (!plan_for(opt.size, &plan) || !image_plan_for(opt.size, &iplan)) {
    *error = "unknown size '" + opt.size + "' (tiny, small, realistic)";
    return false;
  }
  if (opt.bursts > 0) plan.bursts = opt.bursts;
  if (opt.polarisation != "HH" && opt.polarisation != "VV") {
    *error = "polarisation must be HH or VV";
    return false;
  }
  s->polar = opt.polarisation == "HH" ? "H/H" : "V/V";
  if (!opt.pass.empty() && opt.pass != "ascending" && opt.pass != "descending") {
    *error = "pass must be ascending or descending";
    return false;
  }
  if (opt.pattern != "flat" && opt.pattern != "checkerboard" && opt.pattern != "points" &&
      opt.pattern != "uniform") {
    *error = "pattern must be flat, checkerboard, points or uniform";
    return false;
  }
  const bool want_asc = opt.pass == "ascending";

  // Burst timing: the burst cycle is the sum of the sub-swath dwell times,
  // (rank + echoes) / PRF each; lines of a burst are one line interval apart,
  // and the cycle is no whole number of line intervals.  Image-mode lines
  // follow each other at the pulse repetition interval.
  double duration = 0.0;  // from the earliest first line to the latest last line
  if (s->wide_swath) {
    s->line_interval = kLineInterval;
    s->burst_cycle = 0.0;
    for (int k = 0; k < kSubSwaths; ++k) s->burst_cycle += (kRank[k] + kEchoes[k]) / kPrf[k];
    s->geo_step_lines = kGeoStepLines;
    for (int k = 0; k < kSubSwaths; ++k) {
      const double last = kFirstOffset[k] * s->burst_cycle + (plan.bursts - 1) * s->burst_cycle +
                          (kLinesPerBurst[k] - 1) * s->line_interval;
      duration = std::max(duration, last);
    }
  } else {
    s->line_interval = stated_interval(kImagePrf);
    s->burst_cycle = 0.0;
    s->geo_step_lines = iplan.geo_step;
    duration = (iplan.lines - 1) * s->line_interval;
  }

  // Trajectory and scene start.
  double start = 0.0;
  const bool have_start = !opt.start.empty();
  if (have_start && !parse_utc(opt.start, &start)) {
    *error = "bad start time '" + opt.start + "' (DD-MMM-YYYY HH:MM:SS[.ffffff])";
    return false;
  }
  start = round_us(start);
  if (opt.orbit == "kepler") {
    s->kepler = true;
    s->orbit_source = "kepler";
    if (!have_start) parse_utc("02-MAR-2008 10:00:00", &start);
    const double incl = 98.55;
    const double u_lat = std::asin(std::sin(45.0 * kDeg) / std::sin(incl * kDeg));
    const double u0 = want_asc ? u_lat : M_PI - u_lat;
    s->traj.reset(new KeplerTrajectory(start, 7159500.0, incl, u0, 10.0, 31396));
  } else {
    auto* d = new DorisTrajectory;
    s->traj.reset(d);
    if (!d->load(opt.orbit, error)) return false;
    s->orbit_source = opt.orbit;
    if (!have_start) {
      const double asc_lat = 45.0;
      if (!find_crossing(*d, d->first_time() + 7200.0, d->last_time() - 7200.0, asc_lat, want_asc,
                         &start)) {
        *error = "no suitable default scene in the orbit file";
        return false;
      }
    }
    if (start <= d->start() || start + duration + 1.0 >= d->stop() || start < d->first_time() ||
        start + duration > d->last_time()) {
      *error = "the scene (" + format_utc(start) + " plus " + std::to_string(duration) +
               " s) does not lie inside the orbit file's validity " + format_utc(d->start()) +
               " to " + format_utc(d->stop());
      return false;
    }
  }
  s->t0 = start;
  const State mid = s->traj->at(start + duration / 2);
  s->pass = mid.v.z > 0 ? "ASCENDING" : "DESCENDING";
  if (!opt.pass.empty() && (mid.v.z > 0) != want_asc) {
    *error = "the scene at " + format_utc(start) + " is on a " + s->pass + " pass, not " + opt.pass;
    return false;
  }
  s->abs_orbit = s->traj->at(start).abs_orbit;
  s->rel_orbit = s->abs_orbit % 501 + 1;
  s->cycle = s->abs_orbit / 501 + 3;

  // Pattern kind first: the mean power of each sub-swath depends on it.
  Pattern& p = s->pattern;
  p.kind = opt.pattern;
  p.tapered = p.kind != "uniform" && s->wide_swath;  // the taper is that of the bursts

  // Range layout: real near ranges and sample counts, or a compressed layout
  // whose neighbours overlap by `overlap` samples less a part of a sample.
  int min_samples = 0;
  s->range_spacing = kLightSpeed / (2.0 * s->fs);
  double near = kRealNearTau[0];
  s->stop = s->t0;
  for (int k = 0; k < s->images; ++k) {
    SubSwath& w = s->ss[k];
    w.index = k;
    if (!s->wide_swath) {
      set_image(*s, iplan, k, &w);
      min_samples = k == 0 ? w.samples : std::min(min_samples, w.samples);
      s->stop = std::max(s->stop, w.last_time);
      if (!derive_geometry(*s, &w, error)) return false;
      continue;
    }
    w.beam = "SS" + std::to_string(k + 1);
    w.polar = s->polar;
    w.xca_slot = k == 0 ? 7 : k + 1;  // SS1 has its own slot, SS2..SS5 share IS3..IS6
    w.prf = kPrf[k];
    w.rank = kRank[k];
    w.echoes = kEchoes[k];
    w.pulse_len = kPulseLen[k];
    w.pulse_bw = kPulseBw[k];
    w.look_bw = kLookBw[k];
    w.samples = plan.samples[k] ? plan.samples[k] : kRealSamples[k];
    min_samples = k == 0 ? w.samples : std::min(min_samples, w.samples);
    w.near_tau = plan.samples[k] ? near : kRealNearTau[k];
    w.far_tau = w.near_tau + (w.samples - 1) / s->fs;
    if (k + 1 < kSubSwaths) near = w.far_tau - (plan.overlap - 1 + kNearFraction[k]) / s->fs;
    w.lines_per_burst = kLinesPerBurst[k];
    w.bursts = plan.bursts;
    w.records = w.bursts * w.lines_per_burst;
    w.first_time = round_us(s->t0 + kFirstOffset[k] * s->burst_cycle);
    w.last_time = record_time(*s, w, w.records - 1);
    s->stop = std::max(s->stop, w.last_time);
    w.time_diff = kTimeDiff[k];
    w.chirp_power = kChirpPower[k];
    w.dop_delta = kDopDelta[k];
    w.rg_window_coef = kRgWindowCoef[k];
    w.az_window_coef = kAzWindowCoef[k];
    w.az_look_bw = kAzLookBw[k];
    w.proc_gain = kProcGain[k];
    w.ext_cal = 1.0e5 * (1.0 + 0.1 * k);
    w.noise = 2.0 + 0.25 * k;
    w.record_size = 17 + 4LL * w.samples;
    w.band = opt.band_limit ? w.pulse_bw : s->fs;
    w.mean_power = (p.kind == "uniform" || p.kind == "flat") ? mean_power(p, w) : 0.0;
    if (!derive_geometry(*s, &w, error)) return false;
  }
  if (opt.first_tie_sample < 1 || opt.first_tie_sample > min_samples - 20) {
    *error = "first tie sample must lie between 1 and " + std::to_string(min_samples - 20);
    return false;
  }
  // Azimuth spacing: ground distance travelled by the mid-range point per line.
  {
    const SubSwath& middle = s->ss[s->images / 2];
    const double tc = middle.centre.t;
    const double tau = middle.centre.tau;
    GroundPoint a, b;
    zero_doppler_point(s->traj->at(tc - 0.5), tau, &a);
    zero_doppler_point(s->traj->at(tc + 0.5), tau, &b);
    s->azimuth_spacing = norm(b.x - a.x) * s->line_interval;
  }
  // Product corners: first and last line of the product at the near range of
  // the first image (SS1), the middle of the swath and the far range of the
  // last (SS5).
  const SubSwath& far_image = s->ss[s->images - 1];
  if (!corner(*s, (s->t0 + s->stop) / 2, (s->ss[0].near_tau + far_image.far_tau) / 2, &s->centre)) {
    *error = "no ground intersection for the scene centre";
    return false;
  }
  {
    const double taus[3] = {s->ss[0].near_tau, (s->ss[0].near_tau + far_image.far_tau) / 2,
                            far_image.far_tau};
    const double times[2] = {s->t0, s->stop};
    for (int a = 0; a < 2; ++a)
      for (int r = 0; r < 3; ++r) {
        GroundPoint g;
        if (!zero_doppler_point(s->traj->at(times[a]), taus[r], &g)) {
          *error = "no ground intersection for the product corners";
          return false;
        }
        s->sph_lat[3 * a + r] = g.geo.lat_deg;
        s->sph_lon[3 * a + r] = g.geo.lon_deg;
      }
  }

  // Doppler centroid records: about every four seconds, at least two.
  duration = s->stop - s->t0;
  s->dop_ref_tau = s->ss[0].near_tau;
  const int nd = std::max(2, static_cast<int>(std::lround(duration / 4.0)) + 1);
  for (int j = 0; j < nd; ++j) {
    s->dop_times.push_back(round_us(s->t0 + duration * j / (nd - 1)));
    s->dop_c0.push_back(30.0 + 2.0 * j);
  }
  for (int i = 0; i < 8; ++i) s->droop[i] = 1.0 - 0.01 * i;
  s->temperature = 27.5;

  // Reflectivity pattern on (time from the first line, range time from SS1 near).
  const double rg_extent = far_image.far_tau - s->ss[0].near_tau;
  const int checker_az = s->wide_swath ? plan.checker_az : iplan.checker_az;
  const int checker_rg = s->wide_swath ? plan.checker_rg : iplan.checker_rg;
  const int targets_az = s->wide_swath ? plan.targets_az : iplan.targets_az;
  const int targets_rg = s->wide_swath ? plan.targets_rg : iplan.targets_rg;
  p.az_cell = duration / checker_az;
  p.rg_cell = rg_extent / checker_rg;
  if (p.kind == "points") {
    p.target_half_az = 1.0 * s->line_interval;
    p.target_half_rg = 1.0 / s->fs;
    for (int a = 0; a < targets_az; ++a)
      for (int r = 0; r < targets_rg; ++r) {
        Target tg;
        tg.t = round_us(duration * (a + 0.5) / targets_az);
        tg.tau = rg_extent * (r + 0.5) / targets_rg;
        Corner c;
        if (!corner(*s, s->t0 + tg.t, s->ss[0].near_tau + tg.tau, &c)) {
          *error = "no ground intersection for a point target";
          return false;
        }
        tg.lat = c.lat;
        tg.lon = c.lon;
        p.targets.push_back(tg);
      }
  }

  // File names by the ESA convention.
  char buf[128];
  const int dur_s = static_cast<int>(std::lround(s->stop - s->t0));
  std::snprintf(buf, sizeof buf, "ASA_%s_1PNPDK%s_%08d2%03d_%05d_%05d_%04d.N1",
                s->product_type.c_str(), format_compact(s->t0).c_str(), dur_s, s->cycle % 1000,
                s->rel_orbit, s->abs_orbit % 100000, static_cast<int>(opt.seed % 10000));
  s->product_name = buf;
  if (!opt.wrong_type.empty()) {
    std::string code = opt.wrong_type.substr(0, 10);
    code.resize(10, '_');
    s->product_name.replace(0, 10, code);
  }
  s->xca_start = std::floor(s->t0 - 30 * 86400.0);
  s->xca_stop = std::floor(s->t0 + 300 * 86400.0);
  const std::string validity = format_compact(s->xca_start) + "_" + format_compact(s->xca_stop);
  const std::string created = format_compact(s->xca_start - 86400.0);
  s->xca_name = "ASA_XCA_AXVIEC" + created + "_" + validity;
  s->ins_name = "ASA_INS_AXVIEC" + created + "_" + validity;
  if (s->kepler) {
    const double first = std::floor((s->t0 - 7200.0) / 60.0) * 60.0;
    const double last = first + 60.0 * std::ceil((s->stop + 3600.0 - first) / 60.0);
    s->orbit_first = first;
    s->orbit_last = last;
    s->orbit_name = "DOR_VOR_AXVF-P" + format_compact(last + 86400.0) + "_" +
                    format_compact(first) + "_" + format_compact(last);
  } else {
    const size_t slash = opt.orbit.find_last_of('/');
    s->orbit_name = slash == std::string::npos ? opt.orbit : opt.orbit.substr(slash + 1);
  }
  return true;
}

}  // namespace synth
