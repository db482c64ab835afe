// The scene the generator writes: options, timing, the layout of its images
// (the sub-swaths of a wide-swath product, or the one or two images of an
// image-mode product), reflectivity pattern, and the geometric truth derived
// from the trajectory.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "synth_geometry.h"

namespace synth {

constexpr int kSubSwaths = 5;
// Most images of one product: the five sub-swaths of a wide-swath product.
constexpr int kMaxImages = kSubSwaths;

struct Options {
  std::string out_dir;
  uint64_t seed = 1;
  // WSS: wide-swath SLC, five sub-swaths of bursts; IMS: image-mode SLC, one
  // image; APS: alternating-polarisation SLC, two images of one swath.
  std::string product = "WSS";
  std::string size = "tiny";  // tiny, small, realistic
  std::string start;          // sensing start text; empty: the default
  // HH or VV; of an APS product the co-polarised image (the other is crossed).
  std::string polarisation = "HH";
  std::string pass;   // ascending, descending; empty: descending (or as --start gives)
  std::string orbit;  // a DORIS file or "kepler"
  std::string pattern = "checkerboard";  // flat, checkerboard, points, uniform
  bool band_limit = false;   // range spectrum limited to the sub-swath's chirp bandwidth
  int first_tie_sample = 1;  // sample number of the first tie point of every grid line
  int bursts = 0;            // WSS: bursts per sub-swath; 0: those of the size
  // Defects.
  int blank_first = 0, blank_last = 0;
  bool blank_zero_time = false;  // blank records carry zero time fields
  // Measurement data sets written (WSS only); -1: all.
  int mds_count = -1;
  int64_t truncate_at = -1;
  int dsd_beyond_end = -1;
  int zero_count = -1;
  std::string wrong_type;
};

struct Corner {
  double t = 0, tau = 0;
  double lat = 0, lon = 0, incidence = 0, look = 0;
  // Direction of the Earth-fixed satellite velocity at t in the horizontal
  // plane of the ground point, degrees clockwise from north (0..360).
  double heading = 0;
};

// One sub-swath (beam) of a wide-swath product, or one image of an
// image-mode product: its own timing, sampling and processing values.
struct SubSwath {
  int index = 0;  // 0..4
  // "SS1".."SS5", or the swath of an image-mode image ("IS2").
  std::string beam;
  std::string polar;  // "H/H", "V/V", "H/V", "V/H"
  int xca_slot = 0;   // slot of the calibration files (0..7)
  int samples = 0;
  // Images without bursts have lines_per_burst and bursts 0: their records
  // are one line interval apart.
  int lines_per_burst = 0, bursts = 0, records = 0;
  double prf = 0, pulse_len = 0, pulse_bw = 0, look_bw = 0;
  int rank = 0, echoes = 0;
  double near_tau = 0, far_tau = 0;
  // Zero-Doppler time of the first line of the first burst and of the last
  // line of the last burst; time_diff is the float stored beside the first.
  double first_time = 0, last_time = 0;
  float time_diff = 0;
  Corner first_near, first_far, last_near, last_far, centre;
  // A centre by the approximate rule: the middle sample (half the samples,
  // rounded up) and, for bursts, half the bursts' cycles after the first
  // line (else the middle line).  The image's own middle is `centre`.
  Corner header_centre;
  double chirp_power = 0;
  int dop_delta = 0;
  double rg_window_coef = 0, az_window_coef = 0, az_look_bw = 0;
  double proc_gain = 0, ext_cal = 0, noise = 0;
  double elev_centre = 0;  // look angle at the sub-swath centre (XCA reference angle)
  // Azimuth FM rate c0 + c1 r + c2 r^2, r = range time - fm_origin_tau; the
  // origin is the float32 nanosecond value the record stores.
  double fm_rate[3] = {0, 0, 0}, fm_origin_tau = 0;
  double band = 0;        // two-sided range bandwidth of the samples (Hz)
  double mean_power = 0;  // expected |sample|^2 over the sub-swath (0: not stated)
  int64_t record_size = 0;
};

struct Target {
  double t = 0, tau = 0, lat = 0, lon = 0;
};

struct Pattern {
  std::string kind;
  double scale = 100.0;             // std dev of I and Q for reflectivity 1 at full illumination
  double az_cell = 0, rg_cell = 0;  // checkerboard cell (s, s of two-way range time)
  double high = 1.0, low = 0.25;
  double background = 1.0, target_level = 64.0;
  double target_half_az = 0, target_half_rg = 0;  // half extent of a target (s)
  std::vector<Target> targets;
  bool tapered = true;  // burst taper applied (all kinds but uniform)
  // Reflectivity at zero-Doppler time offset daz (from the first line) and
  // range time offset drg (from the near range of SS1).
  double at(double daz, double drg) const;
};

struct Scene {
  Options opt;
  std::string product_type = "WSS";  // WSS, IMS, APS
  bool wide_swath = true;            // bursts and sub-swaths
  int images = kSubSwaths;           // entries of ss[] in use
  // SPH swath, descriptor and algorithm.
  std::string swath = "WS ";
  std::string descriptor = "Wide Swath SLC Image";
  std::string algorithm = "SPECAN ";

  std::unique_ptr<Trajectory> traj;
  bool kepler = false;
  std::string orbit_source;  // path of the real file or "kepler"
  double t0 = 0, stop = 0;   // earliest first line and latest last line of all images
  // Line interval; burst cycle, 0 for images without bursts.
  double line_interval = 0, burst_cycle = 0;
  int geo_step_lines = 0;  // line intervals between geolocation grid lines
  double fs = 19.20768e6, fc = 5.331004416e9;
  double range_spacing = 0, azimuth_spacing = 0;
  SubSwath ss[kMaxImages];
  std::string pass, polar;  // polar: that of the first image
  int abs_orbit = 0, rel_orbit = 0, cycle = 0;
  Pattern pattern;
  // Doppler centroid: per record coefficients about the reference range time.
  double dop_ref_tau = 0;
  std::vector<double> dop_times;
  std::vector<double> dop_c0;
  double dop_c1 = -1.5e4;
  double droop[8] = {0}, temperature = 0;
  // Middle of the scene: of the earliest first and latest last line, and of
  // the near range of the first image and the far range of the last.
  Corner centre;
  // Product corners of the SPH: first and last line at near, mid and far range.
  double sph_lat[6] = {0}, sph_lon[6] = {0};
  // File names in the output folder.
  std::string product_name, orbit_name, xca_name, ins_name;
  double orbit_first = 0, orbit_last = 0;  // records of a generated orbit file
  double xca_start = 0, xca_stop = 0;
};

// Builds the scene; false with a message on bad options.
bool build_scene(const Options& opt, Scene* scene, std::string* error);
// Number of measurement data sets written (the first images of ss[]).
int mds_written(const Scene& s);
// Zero-Doppler time of MDS record r (from 0) of a sub-swath: line r mod L of
// burst r / L, bursts a burst cycle apart, lines a line interval apart.  An
// image without bursts has its records one line interval apart.
double record_time(const Scene& s, const SubSwath& w, int r);
// Two-way elevation pattern of the generated calibration files, in dB, at an
// angle offset (degrees) from the reference angle of slot `slot` (0..7).
double xca_pattern_db(int slot, double offset_deg);
// Power taper of line i of a burst of L lines.
double burst_taper(int i, int lines_per_burst);

}  // namespace synth
