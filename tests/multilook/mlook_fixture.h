// Generator products imported once per test program (extraction and header
// conversion), multilooked by each test in its own installation, and the
// truth that the results are checked against.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "extraction/images.h"
#include "multilook/mlook.h"
#include "raster/cell_type.h"
#include "runtime/ckerr.h"
#include "runtime/suite_state.h"
#include "sar_container/general_sar.h"
#include "suite_fixture.h"
#include "synth_geometry.h"
#include "synth_run.h"

namespace mlook_test {

constexpr double kHalfSpeedOfLight = 149896229.0;
// Ground sampling step of the installed parameter file, m.
constexpr double kGroundStep = 75.0;

// A generated product with its five sub-swaths extracted and converted:
// rasters "<root>k_slc" with their suite headers.
struct Imported {
  synth_test::SynthRun run;
  std::string root;
  double number(const std::string& section, const std::string& key) const {
    return synth_test::truth_number(run.truth, section, key);
  }
  double swath(int k, const std::string& key) const {
    return number("SubSwath" + std::to_string(k + 1), key);
  }
};

// A float raster read whole: lines x samples.
struct Image {
  int samples = 0, lines = 0;
  std::vector<float> v;
  double noData = NAN;
  float at(int line, int sample) const { return v[static_cast<size_t>(line) * samples + sample]; }
  double power(int line, int sample) const {
    const double a = at(line, sample);
    return a * a;
  }
  // Bilinear amplitude at column x, line y (pixel centres at whole
  // numbers); NaN outside the image or next to a pixel without data.
  double sample(double x, double y) const {
    const int i = static_cast<int>(std::floor(x)), j = static_cast<int>(std::floor(y));
    if (i < 0 || j < 0 || i + 1 >= samples || j + 1 >= lines) return NAN;
    const double u = x - i, w = y - j;
    const double a = at(j, i), b = at(j, i + 1), c = at(j + 1, i), d = at(j + 1, i + 1);
    if (a == noData || b == noData || c == noData || d == noData) return NAN;
    return (1 - w) * ((1 - u) * a + u * b) + w * ((1 - u) * c + u * d);
  }
};

// Result of one multilook run.
struct Output {
  int code = -1;
  std::string name;  // the output raster
  Image image;
  std::unique_ptr<GeneralSAR> header;  // "<name>.hdr"
  int looks = 0, decimation = 0;
};

class MultilookTest : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    init_ckerr_locking();
    init_report(0, "ASAR FOCUSSING", 1);
    inst_.hostFiles();
    vlr_detail::suite().workingFile = inst_.workingFile();
  }
  static void TearDownTestSuite() {
    for (auto& p : products()) synth_test::remove_run(p.second->run);
    products().clear();
  }

  // The product of the generator arguments, generated and imported on
  // first use.
  const Imported& product(const std::string& args) {
    auto& cache = products();
    auto found = cache.find(args);
    if (found != cache.end()) return *found->second;
    auto p = std::make_unique<Imported>();
    p->run = synth_test::run_synth(args);
    EXPECT_EQ(p->run.exit_code, 0) << args;
    images_conf conf;
    images ex(conf);
    std::snprintf(ex.input.ASA_level1_filename, kImagesNameSize, "%s", p->run.product.c_str());
    std::snprintf(ex.input.ASA_dor_vor, kImagesNameSize, "%s%s", p->run.dir.c_str(),
                  text(p->run, "Scene", "OrbitFile").c_str());
    p->root = p->run.dir + "R";
    std::snprintf(ex.output.OutputFile, kImagesNameSize, "%s", p->root.c_str());
    EXPECT_EQ(ex.run(), 0);
    EXPECT_EQ(tessal2kestova(p->root.c_str(), xca(*p).c_str()), 0);
    return *(cache[args] = std::move(p));
  }
  static std::string text(const synth_test::SynthRun& run, const std::string& section,
                          const std::string& key) {
    const auto s = run.truth.find(section);
    return s == run.truth.end() || s->second.count(key) == 0 ? "" : s->second.at(key);
  }
  static std::string xca(const Imported& p) { return p.run.dir + text(p.run, "Scene", "XcaFile"); }

  // The configuration of the installation's parameter file.
  static void installedConfiguration(mlook_conf* conf) {
    const std::string file = SourceDir() + "/data/install/parameters_multilook.hdr";
    ASSERT_EQ(conf->readpar(file.c_str()), 0);
    ASSERT_EQ(conf->checkpar(), 0);
  }
  static std::string SourceDir() { return vlr_test::SourceDir(); }

  // Multilooks `p` into "<working>name" as the driver does; `edit` may
  // change the blocks first.
  // `inspect` sees the processor after a successful run.
  Output multilook(const Imported& p, const std::string& name, bool ground,
                   const std::function<void(mlook_conf&, mlook_input&)>& edit = nullptr,
                   const std::function<void(mlook&)>& inspect = nullptr) {
    Output out;
    mlook_conf conf;
    installedConfiguration(&conf);
    conf.Sl2Gr = ground ? 1 : 0;
    mlook_input input;
    mlook_output output;
    std::snprintf(input.Level1Filename, kMlookNameSize, "%s", p.root.c_str());
    std::snprintf(input.ASA_XCA_Filename, kMlookNameSize, "%s", xca(p).c_str());
    out.name = work(name);
    std::snprintf(output.OutputFilename, kMlookNameSize, "%s", out.name.c_str());
    if (edit) edit(conf, input);
    const int blocks = ckerr_count();
    int kept = 0;
    {
      mlook ml(&conf, &input, &output);
      out.code = ml.readimages_kestova();
      if (out.code == 0) out.code = ml.run();
      if (out.code == 0 && inspect) {
        const int before = ckerr_count();
        inspect(ml);
        kept = ckerr_count() - before;  // blocks the caller takes over
      }
      if (out.code == 0) out.code = ml.writepar();
      const int freed = ml.freeimages();
      if (out.code == 0) out.code = freed;
      out.looks = ml.looks();
      out.decimation = ml.decimation();
    }
    // Every checked block of the run is released, on failure too.
    EXPECT_EQ(ckerr_count(), blocks + kept);
    if (out.code != 0) return out;
    out.header = std::make_unique<GeneralSAR>();
    EXPECT_EQ(out.header->GSread((out.name + ".hdr").c_str()), 0);
    out.image = readImage(out.name, out.header->datafile.data.pixels_per_line,
                          out.header->datafile.data.lines_per_image);
    return out;
  }

  static Image readImage(const std::string& name, int samples, int lines) {
    Image im;
    im.samples = samples;
    im.lines = lines;
    const std::vector<uint8_t> bytes = synth_test::read_file(name);
    EXPECT_EQ(bytes.size(), static_cast<size_t>(samples) * lines * 4) << name;
    im.v.resize(bytes.size() / 4);
    std::memcpy(im.v.data(), bytes.data(), im.v.size() * 4);
    return im;
  }

  // The generator's own trajectory of the product, for ground positions.
  static std::unique_ptr<synth::DorisTrajectory> trajectory(const Imported& p) {
    auto t = std::make_unique<synth::DorisTrajectory>();
    std::string error;
    EXPECT_TRUE(t->load(p.run.dir + text(p.run, "Scene", "OrbitFile"), &error)) << error;
    return t;
  }

 private:
  static std::map<std::string, std::unique_ptr<Imported>>& products() {
    static std::map<std::string, std::unique_ptr<Imported>> cache;
    return cache;
  }
};

// Where a profile of powers crosses the power of the mean amplitude of its
// levels on either side of the expected step at e (inner..outer samples
// away): the middle of a band-limited step in amplitude.  NaN when it does
// not cross within `inner` of e.
inline double Crossing(const std::vector<double>& profile, double e, int inner, int outer) {
  const int c = static_cast<int>(std::lround(e));
  double left = 0.0, right = 0.0;
  for (int i = inner; i <= outer; ++i) {
    left += profile[static_cast<size_t>(c - i)];
    right += profile[static_cast<size_t>(c + i)];
  }
  const double amplitude = 0.5 * (std::sqrt(left) + std::sqrt(right));
  const double level = amplitude * amplitude / (outer - inner + 1);
  double best = NAN;
  for (int i = c - inner; i < c + inner; ++i) {
    const double a = profile[static_cast<size_t>(i)] - level;
    const double b = profile[static_cast<size_t>(i) + 1] - level;
    if (a * b > 0.0 || a == b) continue;
    const double x = i + a / (a - b);
    if (std::isnan(best) || std::fabs(x - e) < std::fabs(best - e)) best = x;
  }
  return best;
}

// Position (column, line) in an image of scene coordinates: time from the
// scene start and range time from the near range of sub-swath 1.
using ScenePosition = std::function<std::array<double, 2>(double daz, double drg)>;

// The checkerboard's cell edges against the truth: the power profile across
// each edge, summed over points along its middle, crosses the level halfway
// (in amplitude) between its sides within one pixel of where `at` puts the
// edge.  Edges whose profiles leave the data, or that lie within half a
// second of the scene's ends (fewer bursts cover them), are skipped; range
// edges are found in every sub-swath.
inline void ExpectCheckerboardEdges(const Imported& p, const Image& im, const ScenePosition& at) {
  const double span = p.number("Scene", "SensingStop") - p.number("Scene", "SensingStart");
  const double near = p.swath(0, "NearRangeTime");
  const double width = p.swath(4, "FarRangeTime") - near;
  const double azCell = p.number("Pattern", "AzCell"), rgCell = p.number("Pattern", "RgCell");
  constexpr int kPoints = 48, kReach = 32;  // profile steps of a quarter pixel
  auto offset = [&](bool range, double fixed, double from, double to) -> double {
    std::vector<double> profile(2 * kReach + 1, 0.0);
    const double d = 0.1 * (range ? rgCell : azCell);
    for (int q = 0; q < kPoints; ++q) {
      const double along = from + (to - from) * q / (kPoints - 1.0);
      const auto a = range ? at(along, fixed - d) : at(fixed - d, along);
      const auto b = range ? at(along, fixed + d) : at(fixed + d, along);
      const auto c = range ? at(along, fixed) : at(fixed, along);
      const double n = std::hypot(b[0] - a[0], b[1] - a[1]);
      for (int s = -kReach; s <= kReach; ++s) {
        const double v =
            im.sample(c[0] + 0.25 * s * (b[0] - a[0]) / n, c[1] + 0.25 * s * (b[1] - a[1]) / n);
        if (std::isnan(v)) return NAN;
        profile[static_cast<size_t>(s + kReach)] += v * v;
      }
    }
    return 0.25 * (Crossing(profile, kReach, 12, kReach) - kReach);
  };
  const double margin = 0.5;
  int rangeEdges[kMlookSwaths] = {}, azimuthEdges = 0;
  for (int a = 0; a * azCell < span; ++a) {
    const double from = (a + 0.3) * azCell, to = (a + 0.7) * azCell;
    if (from < margin || to > span - margin) continue;
    for (int r = 1; r * rgCell < width; ++r) {
      const double x = offset(true, r * rgCell, from, to);
      if (std::isnan(x)) continue;
      EXPECT_LE(std::fabs(x), 1.0) << "range edge " << r << " in azimuth cell " << a;
      int swath = 0;
      while (swath < 4 && near + r * rgCell > p.swath(swath + 1, "NearRangeTime")) ++swath;
      ++rangeEdges[swath];
    }
  }
  for (int r = 0; r * rgCell < width; ++r) {
    const double from = (r + 0.3) * rgCell, to = std::min((r + 0.7) * rgCell, width);
    for (int a = 1; a * azCell < span; ++a) {
      if (a * azCell < margin + azCell * 0.2 || a * azCell > span - margin - azCell * 0.2) continue;
      const double x = offset(false, a * azCell, from, to);
      if (std::isnan(x)) continue;
      EXPECT_LE(std::fabs(x), 1.0) << "azimuth edge " << a << " in range cell " << r;
      ++azimuthEdges;
    }
  }
  for (int k = 0; k < kMlookSwaths; ++k) EXPECT_GT(rangeEdges[k], 0) << "sub-swath " << k + 1;
  EXPECT_GT(azimuthEdges, 10);
}

// Output pixel coordinates of scene times, from the output header's grid:
// lines from its start time and line interval; columns from its first range
// time and sampling in slant range, from the generator's ground range (at
// the middle of the scene) in ground range.  daz: time from the scene
// start; drg: range time from the near range of sub-swath 1.
class Grid {
 public:
  Grid(const Output& o, const Imported& p, const synth::Trajectory* traj)
      : t0_(p.number("Scene", "SensingStart")),
        nearTau_(p.swath(0, "NearRangeTime")),
        start_(o.header->roi.roi.SlowStartTime),
        interval_(o.header->roi.roi.SlowTimeDelta),
        firstTau_(o.header->roi.roi.FastStartTime),
        rate_(o.header->sampling.frg_hz),
        ground_(traj != nullptr) {
    if (!ground_) return;
    // Ground range along the middle line at fine range steps, summed from
    // chords of the generator's ground points.
    const double mid = 0.5 * (t0_ + p.number("Scene", "SensingStop"));
    const synth::State s = traj->at(mid);
    const double far = p.swath(4, "FarRangeTime") + 1e-6;
    synth::GroundPoint previous;
    synth::zero_doppler_point(s, nearTau_, &previous);
    double sum = 0.0;
    for (int i = 0; i <= kSteps; ++i) {
      const double tau = nearTau_ + (far - nearTau_) * i / kSteps;
      synth::GroundPoint g;
      synth::zero_doppler_point(s, tau, &g);
      sum += synth::norm(g.x - previous.x);
      previous = g;
      taus_.push_back(tau - nearTau_);
      grounds_.push_back(sum);
    }
  }
  double line(double daz) const { return (t0_ + daz - start_) / interval_; }
  double time(int line) const { return start_ + line * interval_ - t0_; }
  double column(double drg) const {
    if (!ground_) return (nearTau_ + drg - firstTau_) * rate_;
    return Interpolate(taus_, grounds_, drg) / kGroundStep;
  }
  double rangeTime(int column) const {
    if (!ground_) return firstTau_ + column / rate_ - nearTau_;
    return Interpolate(grounds_, taus_, column * kGroundStep);
  }

 private:
  static constexpr int kSteps = 4000;
  static double Interpolate(const std::vector<double>& x, const std::vector<double>& y, double at) {
    const size_t i = static_cast<size_t>(std::min<std::ptrdiff_t>(
        std::max<std::ptrdiff_t>(std::lower_bound(x.begin(), x.end(), at) - x.begin(), 1),
        static_cast<std::ptrdiff_t>(x.size()) - 1));
    return y[i - 1] + (y[i] - y[i - 1]) * (at - x[i - 1]) / (x[i] - x[i - 1]);
  }
  double t0_, nearTau_, start_, interval_, firstTau_, rate_;
  bool ground_;
  std::vector<double> taus_, grounds_;
};

}  // namespace mlook_test
