#include "synth_scene.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

#include "synth_time.h"

namespace synth {
namespace {

constexpr double kDeg = M_PI / 180.0;

// Wide-swath beam parameters (SS1..SS5) in the ranges of real acquisitions.
const double kPrf[kSubSwaths] = {1712.0, 2095.0, 1675.0, 1886.0, 1707.0};
const int kRank[kSubSwaths] = {9, 10, 9, 10, 9};
const int kEchoes[kSubSwaths] = {64, 78, 63, 71, 64};
const double kPulseLen[kSubSwaths] = {27.1e-6, 24.6e-6, 26.3e-6, 22.8e-6, 25.0e-6};
const double kPulseBw[kSubSwaths] = {16.0e6, 13.0e6, 13.0e6, 11.7e6, 9.6e6};
const double kRealNearTau[kSubSwaths] = {5.48e-3, 5.79e-3, 6.03e-3, 6.32e-3, 6.56e-3};
const int kRealSamples[kSubSwaths] = {6300, 5100, 6200, 5000, 6000};
const int kDopDelta[kSubSwaths] = {0, 6, -4, 9, -7};

struct SizePlan {
  int samples;  // per sub-swath, 0 for the real counts
  int overlap;  // samples shared by neighbours when the layout is compressed
  int bursts;
  int checker_az, checker_rg;
  int targets_az, targets_rg;
};

bool plan_for(const std::string& size, SizePlan* p) {
  if (size == "tiny")
    *p = {128, 16, 4, 3, 8, 2, 4};
  else if (size == "small")
    *p = {320, 32, 30, 6, 12, 4, 8};
  else if (size == "realistic")
    *p = {0, 0, 282, 12, 15, 8, 20};
  else
    return false;
  return true;
}

State state_at(const Scene& s, double t) {
  return s.traj->at(t);
}

bool corner(const Scene& s, double t, double tau, Corner* c) {
  GroundPoint g;
  if (!zero_doppler_point(state_at(s, t), tau, &g)) return false;
  c->t = t;
  c->tau = tau;
  c->lat = g.geo.lat_deg;
  c->lon = g.geo.lon_deg;
  c->incidence = g.incidence_deg;
  c->look = g.look_deg;
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
  if (kind == "flat") return 1.0;
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

bool build_scene(const Options& opt, Scene* s, std::string* error) {
  s->opt = opt;
  SizePlan plan;
  if (!plan_for(opt.size, &plan)) {
    *error = "unknown size '" + opt.size + "' (tiny, small, realistic)";
    return false;
  }
  if (opt.polarisation != "HH" && opt.polarisation != "VV") {
    *error = "polarisation must be HH or VV";
    return false;
  }
  s->polar = opt.polarisation == "HH" ? "H/H" : "V/V";
  if (!opt.pass.empty() && opt.pass != "ascending" && opt.pass != "descending") {
    *error = "pass must be ascending or descending";
    return false;
  }
  if (opt.pattern != "flat" && opt.pattern != "checkerboard" && opt.pattern != "points") {
    *error = "pattern must be flat, checkerboard or points";
    return false;
  }
  const bool want_asc = opt.pass == "ascending";

  // Burst timing: the burst cycle is the sum of the sub-swath dwell times; the
  // line interval divides it into 18 lines; a burst holds three cycles of lines.
  s->burst_cycle = 0.0;
  for (int k = 0; k < kSubSwaths; ++k) s->burst_cycle += (kRank[k] + kEchoes[k]) / kPrf[k];
  s->cycle_lines = 18;
  s->lines_per_burst = 3 * s->cycle_lines;
  s->line_interval = s->burst_cycle / s->cycle_lines;
  s->bursts = plan.bursts;
  s->grid_lines = (s->bursts - 1) * s->cycle_lines + s->lines_per_burst;
  const double duration = (s->grid_lines - 1) * s->line_interval;

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
  s->stop = round_us(start + duration);
  const State mid = s->traj->at(start + duration / 2);
  s->pass = mid.v.z > 0 ? "ASCENDING" : "DESCENDING";
  if (!opt.pass.empty() && (mid.v.z > 0) != want_asc) {
    *error = "the scene at " + format_utc(start) + " is on a " + s->pass + " pass, not " + opt.pass;
    return false;
  }
  s->abs_orbit = s->traj->at(start).abs_orbit;
  s->rel_orbit = s->abs_orbit % 501 + 1;
  s->cycle = s->abs_orbit / 501 + 3;

  // Range layout.
  s->range_spacing = kLightSpeed / (2.0 * s->fs);
  double near = kRealNearTau[0];
  for (int k = 0; k < kSubSwaths; ++k) {
    SubSwath& w = s->ss[k];
    w.index = k;
    w.prf = kPrf[k];
    w.rank = kRank[k];
    w.echoes = kEchoes[k];
    w.pulse_len = kPulseLen[k];
    w.pulse_bw = kPulseBw[k];
    w.samples = plan.samples ? plan.samples : kRealSamples[k];
    w.near_tau = plan.samples ? near : kRealNearTau[k];
    w.far_tau = w.near_tau + (w.samples - 1) / s->fs;
    near = w.far_tau - (plan.overlap - 1) / s->fs;
    w.records = s->bursts * s->lines_per_burst;
    w.first_time = s->t0;
    w.last_time = round_us(s->t0 + ((s->bursts - 1) * s->cycle_lines + s->lines_per_burst - 1) *
                                       s->line_interval);
    w.chirp_power = 1.0 + 0.05 * k;
    w.dop_delta = kDopDelta[k];
    w.record_size = 17 + 4LL * w.samples;
    const double tc = round_us((w.first_time + w.last_time) / 2);
    const double tauc = (w.near_tau + w.far_tau) / 2;
    if (!corner(*s, w.first_time, w.near_tau, &w.first_near) ||
        !corner(*s, w.first_time, w.far_tau, &w.first_far) ||
        !corner(*s, w.last_time, w.near_tau, &w.last_near) ||
        !corner(*s, w.last_time, w.far_tau, &w.last_far) || !corner(*s, tc, tauc, &w.centre)) {
      *error = "no ground intersection for the scene geometry";
      return false;
    }
    w.elev_centre = w.centre.look;
    // Azimuth FM rate -2 v^2 / (lambda R), as a quadratic in range time about near range.
    const State sc = s->traj->at(tc);
    const double v2 = dot(sc.v, sc.v);
    const double lambda = kLightSpeed / s->fc;
    const double fm0 = -2.0 * v2 / (lambda * w.near_tau * kLightSpeed / 2.0);
    w.fm_origin_tau = w.near_tau;
    w.fm_rate[0] = fm0;
    w.fm_rate[1] = -fm0 / w.near_tau;
    w.fm_rate[2] = fm0 / (w.near_tau * w.near_tau);
  }
  // Azimuth spacing: ground distance travelled by the mid-range point per line.
  {
    const double tc = s->ss[2].centre.t;
    const double tau = s->ss[2].centre.tau;
    GroundPoint a, b;
    zero_doppler_point(s->traj->at(tc - 0.5), tau, &a);
    zero_doppler_point(s->traj->at(tc + 0.5), tau, &b);
    s->azimuth_spacing = norm(b.x - a.x) * s->line_interval;
  }

  // Doppler centroid records: about every four seconds, at least two.
  s->dop_ref_tau = s->ss[0].near_tau;
  const int nd = std::max(2, static_cast<int>(std::lround(duration / 4.0)) + 1);
  for (int j = 0; j < nd; ++j) {
    s->dop_times.push_back(round_us(s->t0 + duration * j / (nd - 1)));
    s->dop_c0.push_back(30.0 + 2.0 * j);
  }
  for (int i = 0; i < 8; ++i) s->droop[i] = 1.0 - 0.01 * i;
  s->temperature = 27.5;

  // Reflectivity pattern on (time from the first line, range time from SS1 near).
  Pattern& p = s->pattern;
  p.kind = opt.pattern;
  const double rg_extent = s->ss[4].far_tau - s->ss[0].near_tau;
  p.az_cell = duration / plan.checker_az;
  p.rg_cell = rg_extent / plan.checker_rg;
  if (p.kind == "points") {
    p.target_half_az = 1.0 * s->line_interval;
    p.target_half_rg = 1.0 / s->fs;
    for (int a = 0; a < plan.targets_az; ++a)
      for (int r = 0; r < plan.targets_rg; ++r) {
        Target tg;
        tg.t = round_us(duration * (a + 0.5) / plan.targets_az);
        tg.tau = rg_extent * (r + 0.5) / plan.targets_rg;
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
  std::snprintf(buf, sizeof buf, "ASA_WSS_1PNPDK%s_%08d2%03d_%05d_%05d_%04d.N1",
                format_compact(s->t0).c_str(), dur_s, s->cycle % 1000, s->rel_orbit,
                s->abs_orbit % 100000, static_cast<int>(opt.seed % 10000));
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
