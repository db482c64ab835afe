// The multilook command end to end, run the way the host runs it: an
// installation, an argument-list file, the working file with "_batch_ok",
// then the tool's exit code, Process.log, the error file and the files it
// wrote.  Sizes and positions are checked against the generator's truth and
// its own orbit geometry; the headers are read back with python's XML
// parser and the TIFF image with GDAL.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <functional>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "host_run.h"
#include "synth_geometry.h"
#include "truth_math.h"

using synth_test::SynthRun;
using vlr_test::Exists;
using vlr_test::Field;
using vlr_test::Outcome;
using vlr_test::ReadFile;
using vlr_test::SubSwath;
using vlr_test::Truth;
using vlr_test::TruthNumber;
using vlr_test::WriteFile;
using Fields = vlr_test::SmlFields;

namespace {

constexpr const char* kMultilook = "main_multilook_WSS#";
constexpr const char* kImport = "main_import_ESA#";
// The import's positions of the orbit, calibration file, output root and
// instrument file.
constexpr size_t kImportDoris = 1, kImportXca = 2, kImportRoot = 3, kImportIns = 4;
constexpr const char* kNotOK = "NotOK";
constexpr const char* kOK = "OK";
constexpr size_t kProduct = 0, kRoot = 1, kDoris = 2, kGroundRange = 6, kTiff = 12,
                 kSaturation = 13;
constexpr int kSubSwaths = 5;
constexpr double kHalfSpeedOfLight = 149896229.0;
// "GrSamplingStep" of the installation's parameter file, metres.
constexpr double kGroundStep = 75.0;
// "GrResolution" of the slant range run, metres; on the generated scene it
// asks for 5 range looks, the installation's 120 m for 3.
constexpr int kSlantResolution = 150;
constexpr size_t kFloatBytes = 4;
// A descending scene on the real DOR_VOR orbit, and an ascending one on the
// real preliminary orbit (DOR_POR).
constexpr const char* kVor = "--size tiny --pass descending";
const std::string kPor =
    "--size tiny --pass ascending --polarisation VV --seed 3 --orbit " + vlr_test::kSamplePor;

Fields ReadSml(const std::string& sml) {
  return vlr_test::ReadSml(sml,
                           "NrOfLinesPerImage,NrOfPixelsPerLine,PixelSpacingRg,CellType,DataUnits,"
                           "PRODUCT,Projection,SceneHeading,OrbitConfiguration,NRangeLooks,"
                           "NAzimuthLooks");
}

long Integer(const Fields& f, const std::string& name) {
  return std::atol(Field(f, name).c_str());
}

long FileSize(const std::string& path) {
  struct stat st {};
  return stat(path.c_str(), &st) == 0 ? static_cast<long>(st.st_size) : -1;
}

// The generator's geometry of a ground-range image: the zero-Doppler ground
// point at azimuth time t that lies `distance` metres along the ellipsoid
// from the ground point of range time nearTau (negative: towards nadir).
synth::Vec3 GroundRangePoint(const synth::Trajectory& orbit, double t, double nearTau,
                             double distance) {
  // Slant-range steps of 10 m: the ground between two steps is straight to
  // well under a millimetre.
  constexpr double kStep = 10.0 / kHalfSpeedOfLight;
  const synth::State s = orbit.at(t);
  const double step = distance >= 0.0 ? kStep : -kStep;
  synth::GroundPoint a, b;
  synth::zero_doppler_point(s, nearTau, &a);
  double travelled = 0.0;
  for (double tau = nearTau + step;; tau += step) {
    if (!synth::zero_doppler_point(s, tau, &b)) return {};
    const double piece = synth::norm(b.x - a.x);
    if (travelled + piece >= std::fabs(distance)) {
      const double f = (std::fabs(distance) - travelled) / piece;
      return a.x + f * (b.x - a.x);
    }
    travelled += piece;
    a = b;
  }
}

// A ground control point as gdalinfo lists it.
struct Gcp {
  double pixel = 0, line = 0, lon = 0, lat = 0;
};
struct GdalView {
  int status = -1;
  std::string text;
  int width = 0, height = 0;
  std::vector<Gcp> gcps;
};

GdalView GdalInfo(const std::string& tif) {
  GdalView v;
  const vlr_test::RunResult r = vlr_test::RunProgram({"/usr/bin/env", "gdalinfo", tif}, {}, true);
  v.status = r.status;
  v.text = r.out + r.err;
  std::istringstream lines(r.out);
  for (std::string line; std::getline(lines, line);) {
    Gcp g;
    double height = 0;
    if (std::sscanf(line.c_str(), "Size is %d, %d", &v.width, &v.height) == 2) continue;
    // "          (0.5,0.5) -> (12.3,45.6,0)"
    if (std::sscanf(line.c_str(), " (%lf,%lf) -> (%lf,%lf,%lf)", &g.pixel, &g.line, &g.lon, &g.lat,
                    &height) == 5)
      v.gcps.push_back(g);
  }
  return v;
}

struct MultilookRun {
  std::vector<std::string> args;
  Outcome outcome;
};

class MultilookCommand : public vlr_test::HostRunTest {
 protected:
  void TearDown() override { parameters({}); }
  static const SynthRun& vor() { return scene(kVor); }
  static const SynthRun& por() { return scene(kPor); }
  // Exactly 14 arguments: product, output root and orbit, the rest "NotOK".
  static std::vector<std::string> arguments(const SynthRun& run, const std::string& root) {
    std::vector<std::string> a(14, kNotOK);
    a[kProduct] = run.product;
    a[kRoot] = root;
    a[kDoris] = orbitOf(run);
    return a;
  }
  // The same for the import: product, orbit and output root.
  static std::vector<std::string> importArguments(const SynthRun& run, const std::string& root) {
    std::vector<std::string> a(14, kNotOK);
    a[kProduct] = run.product;
    a[kImportDoris] = orbitOf(run);
    a[kImportRoot] = root;
    return a;
  }
  static Outcome runTool(const std::vector<std::string>& args) {
    return vlr_test::RunAsHost(inst(), kMultilook, args);
  }
  // A run of `run` over a new folder with the parameter file edited and the
  // arguments at the given positions set.
  static MultilookRun runWith(const SynthRun& run, const std::string& name,
                              const std::map<std::string, std::string>& edits,
                              const std::map<size_t, std::string>& set) {
    MultilookRun m{arguments(run, folder(name) + "R"), {}};
    for (const auto& [at, value] : set) m.args[at] = value;
    parameters(edits);
    useAuxiliaryListOf(run);
    m.outcome = runTool(m.args);
    parameters({});
    return m;
  }
  // Ground range asked for by the command while the parameter file says
  // slant range, with the TIFF copy.
  static const MultilookRun& groundRun() {
    static const MultilookRun r = runWith(vor(), "ground", {{"Sl2Gr", "0"}},
                                          {{kGroundRange, kOK}, {kTiff, kOK}, {kSaturation, "2"}});
    return r;
  }
  // Slant range while the parameter file says ground range; "ok" is not "OK"
  // for either switch.
  static const MultilookRun& slantRun() {
    static const MultilookRun r = runWith(
        vor(), "slant", {{"Sl2Gr", "1"}, {"GrResolution", std::to_string(kSlantResolution)}},
        {{kGroundRange, "ok"}, {kTiff, "ok"}});
    return r;
  }
  // The preliminary orbit, ground range and TIFF, installed parameters.
  static const MultilookRun& porRun() {
    static const MultilookRun r = runWith(por(), "por", {}, {{kGroundRange, kOK}, {kTiff, kOK}});
    return r;
  }
};

// A successful run: exit 0, the START record with the inputs, SUCCESSFUL and
// the END record, no error anywhere, the working file deleted.
void ExpectSuccess(const Outcome& o, const std::vector<std::string>& args) {
  vlr_test::ExpectSuccessRecords(o, "Multilooking ASA WSS",
                                 "\nINPUT ASA_RS : [ " + args[kProduct] +
                                     " ]\nOUTPUT ROOT NAME : [ " + args[kRoot] +
                                     " ]\nINPUT DORIS : [ " + args[kDoris] + " ]");
}

// The output of a successful run over `root` ("_gr" or "_pwr" appended) and
// what lies beside it: the list file of the import, the raster as large as
// its headers say, the ENVI header that replaced the processor header, the
// suite header of the composed swath, and no temporary or other-geometry
// files.
Fields ExpectOutput(const SynthRun& run, const std::string& root, bool ground) {
  std::string list;
  for (int k = 1; k <= kSubSwaths; ++k) list += root + std::to_string(k) + "_slc\n";
  EXPECT_EQ(ReadFile(root), list);
  const std::string output = root + (ground ? "_gr" : "_pwr");
  EXPECT_FALSE(Exists(root + (ground ? "_pwr" : "_gr")));
  for (int k = 1; k <= kSubSwaths; ++k) EXPECT_FALSE(Exists(output + "SS" + std::to_string(k)));

  const Fields f = ReadSml(output + ".sml");
  const long lines = Integer(f, "NrOfLinesPerImage");
  const long samples = Integer(f, "NrOfPixelsPerLine");
  EXPECT_EQ(FileSize(output), lines * samples * static_cast<long>(kFloatBytes));
  const std::string envi = ReadFile(output + ".hdr");
  EXPECT_EQ(envi.rfind("ENVI\n", 0), 0u) << envi;
  EXPECT_NE(envi.find("\nsamples = " + std::to_string(samples) + "\n"), std::string::npos) << envi;
  EXPECT_NE(envi.find("\nlines = " + std::to_string(lines) + "\n"), std::string::npos) << envi;
  EXPECT_NE(envi.find("\ndata type = 4\n"), std::string::npos) << envi;
  // A ground-range image states its ground spacing as it is.
  EXPECT_EQ(Field(f, "Projection"), ground ? "GROUND_RANGE" : "SLANT_RANGE");
  if (ground) {
    EXPECT_NE(envi.find("\npixel size = {75, "), std::string::npos) << envi;
  }
  EXPECT_EQ(Field(f, "CellType"), "FLOAT");
  // The heading of the ground track at the centre of the scene.
  EXPECT_EQ(Field(f, "OrbitConfiguration"), Truth(run, "Scene", "Pass"));
  EXPECT_NEAR(std::atof(Field(f, "SceneHeading").c_str()),
              TruthNumber(run, "Scene", "CentreHeading"), 0.1);

  // The scene text names the geometry of the image, as the projection does.
  EXPECT_EQ(Field(f, "OtherInfo.SCENE DATA"),
            "ENVISAT-1|ENVISAT_WSM|ALL|" + Truth(run, "Scene", "Polarisation") + "|" +
                Truth(run, "Scene", "Pass") + (ground ? "|GROUND_RANGE" : "|SLANT_RANGE"));
  EXPECT_EQ(Field(f, "OtherInfo.ORIGIN DATA"), ground ? "ENVISAT_WS_GR" : "ENVISAT_WS_SR");
  // The fixed ENVISAT header of a composed product comes from the
  // calibration file chosen from the auxiliary list.
  std::string product = Field(f, "PRODUCT");
  product.erase(product.find_last_not_of(' ') + 1);
  EXPECT_EQ(product, Truth(run, "Scene", "XcaFile"));

  // One output line per input line interval from the first line of the
  // scene to its last.
  const double span =
      TruthNumber(run, "Scene", "SensingStop") - TruthNumber(run, "Scene", "SensingStart");
  EXPECT_NEAR(lines, span / TruthNumber(run, "Scene", "LineTimeInterval") + 1.0, 1.0);
  return f;
}

// Ground range from the near edge of sub-swath 1 to the far edge of
// sub-swath 5 at azimuth time t (by default the first line of the scene).
double SwathWidthOnGround(const SynthRun& run, double t = NAN) {
  synth::DorisTrajectory orbit;
  std::string error;
  EXPECT_TRUE(orbit.load(run.dir + Truth(run, "Scene", "OrbitFile"), &error)) << error;
  const synth::State s = orbit.at(std::isnan(t) ? TruthNumber(run, "Scene", "SensingStart") : t);
  const double near = TruthNumber(run, SubSwath(1), "NearRangeTime");
  const double far = TruthNumber(run, SubSwath(kSubSwaths), "FarRangeTime");
  constexpr int kPieces = 1000;
  double width = 0.0;
  synth::GroundPoint a, b;
  synth::zero_doppler_point(s, near, &a);
  for (int i = 1; i <= kPieces; ++i) {
    synth::zero_doppler_point(s, near + (far - near) * i / kPieces, &b);
    width += synth::norm(b.x - a.x);
    a = b;
  }
  return width;
}

// The floats of a raster file in host order.
std::vector<float> Floats(const std::string& path) {
  const std::vector<uint8_t> bytes = synth_test::read_file(path);
  std::vector<float> values(bytes.size() / sizeof(float));
  if (!values.empty()) std::memcpy(values.data(), bytes.data(), values.size() * sizeof(float));
  return values;
}

// What GDAL reads from `source` opened by that name, as a headerless copy;
// empty when it refuses the file.
std::vector<uint8_t> GdalCopy(const std::string& source, const std::string& copy) {
  if (synth_test::shell("gdal_translate -q -of ENVI '" + source + "' '" + copy + "'") != 0)
    return {};
  return synth_test::read_file(copy);
}

// The TIFF copy of a ground-range output: GDAL opens it with the output's
// size; its ground control points lie within one output pixel of the
// generator's ground point of their image position, and those at the image
// corners within one pixel of the scene's corners; its suite header is
// well-formed XML describing the 8-bit image.
void ExpectTiff(const SynthRun& run, const std::string& output) {
  const Fields f = ReadSml(output + ".sml");
  const long lines = Integer(f, "NrOfLinesPerImage");
  const long samples = Integer(f, "NrOfPixelsPerLine");
  const Fields tifHeader = ReadSml(output + ".tif.sml");
  EXPECT_EQ(Field(tifHeader, "CellType"), "UNSIGNED_BYTE");
  EXPECT_EQ(Integer(tifHeader, "NrOfLinesPerImage"), lines);
  EXPECT_EQ(Integer(tifHeader, "NrOfPixelsPerLine"), samples);

  const GdalView v = GdalInfo(output + ".tif");
  ASSERT_EQ(v.status, 0) << v.text;
  EXPECT_EQ(v.width, samples);
  EXPECT_EQ(v.height, lines);
  ASSERT_FALSE(v.gcps.empty()) << "no ground control points:\n" << v.text;
  EXPECT_NE(v.text.find("GCP Projection = "), std::string::npos) << v.text;
  EXPECT_NE(v.text.find("WGS 84"), std::string::npos) << v.text;

  synth::DorisTrajectory orbit;
  std::string error;
  ASSERT_TRUE(orbit.load(run.dir + Truth(run, "Scene", "OrbitFile"), &error)) << error;
  const double start = TruthNumber(run, "Scene", "SensingStart");
  const double interval = TruthNumber(run, "Scene", "LineTimeInterval");
  const double nearTau = TruthNumber(run, SubSwath(1), "NearRangeTime");
  const double pixel = std::hypot(kGroundStep, TruthNumber(run, "Scene", "AzimuthSpacing"));
  // GDAL places pixel i between i and i + 1: its centre is at i + 0.5.
  for (const Gcp& g : v.gcps) {
    const double t = start + (g.line - 0.5) * interval;
    const synth::Vec3 truth = GroundRangePoint(orbit, t, nearTau, (g.pixel - 0.5) * kGroundStep);
    EXPECT_LE(truth::Distance(truth::EarthFixed(g.lat, g.lon), {truth.x, truth.y, truth.z}), pixel)
        << "GCP (" << g.pixel << ", " << g.line << ") -> (" << g.lon << ", " << g.lat << ")";
  }
  const struct {
    double pixel, line;
    const char* truth;
  } corners[] = {{0.5, 0.5, "SphFirstNear"},
                 {samples - 0.5, 0.5, "SphFirstFar"},
                 {0.5, lines - 0.5, "SphLastNear"},
                 {samples - 0.5, lines - 0.5, "SphLastFar"}};
  for (const auto& c : corners) {
    SCOPED_TRACE(c.truth);
    const auto closest =
        std::min_element(v.gcps.begin(), v.gcps.end(), [&](const Gcp& a, const Gcp& b) {
          return std::hypot(a.pixel - c.pixel, a.line - c.line) <
                 std::hypot(b.pixel - c.pixel, b.line - c.line);
        });
    ASSERT_LE(std::hypot(closest->pixel - c.pixel, closest->line - c.line), 1.0)
        << "no ground control point at this corner";
    EXPECT_LE(truth::SurfaceDistance(closest->lat, closest->lon,
                                     TruthNumber(run, "Scene", std::string(c.truth) + "Lat"),
                                     TruthNumber(run, "Scene", std::string(c.truth) + "Lon")),
              pixel);
  }
}

// The outputs of the descending scene in ground range (asked for by the
// command while the parameter file says slant range), in slant range (the
// other way round; "ok" is not "OK" for either switch) and of the ascending
// scene on the preliminary orbit, against the generator's scene.
TEST_F(MultilookCommand, OutputsMatchTheGeneratedScene) {
  ExpectSuccess(porRun().outcome, porRun().args);
  ExpectOutput(por(), porRun().args[kRoot], true);
  ExpectSuccess(groundRun().outcome, groundRun().args);
  const Fields ground = ExpectOutput(vor(), groundRun().args[kRoot], true);
  // Samples every GrSamplingStep from the near edge of the first sub-swath
  // up to the far edge of the last.
  EXPECT_NEAR(Integer(ground, "NrOfPixelsPerLine"), SwathWidthOnGround(vor()) / kGroundStep + 1.0,
              1.0);
  EXPECT_TRUE(Exists(groundRun().args[kRoot] + "_gr.tif"));

  ExpectSuccess(slantRun().outcome, slantRun().args);
  const Fields slant = ExpectOutput(vor(), slantRun().args[kRoot], false);
  // The composed lines cover the slant range from the first sample of the
  // first sub-swath to the last of the fifth; beyond it at most the padding
  // of the fifth sub-swath's range transform, whose length is rounded up to
  // one with small prime factors (a few percent).
  const double near = TruthNumber(vor(), SubSwath(1), "NearRangeTime");
  const double lastNear = TruthNumber(vor(), SubSwath(kSubSwaths), "NearRangeTime");
  const double far = TruthNumber(vor(), SubSwath(kSubSwaths), "FarRangeTime");
  const double span = (far - near) * kHalfSpeedOfLight;
  const double padding = 0.1 * (far - lastNear) * kHalfSpeedOfLight;
  const double spacing = std::atof(Field(slant, "PixelSpacingRg").c_str());
  const double width = Integer(slant, "NrOfPixelsPerLine") * spacing;
  EXPECT_GE(width, span - spacing);
  EXPECT_LE(width, span + padding + spacing);
  EXPECT_FALSE(Exists(slantRun().args[kRoot] + "_pwr.tif"));
  EXPECT_FALSE(Exists(slantRun().args[kRoot] + "_pwr.tif.sml"));
  EXPECT_EQ(slantRun().outcome.log.find("MAKE TIFF OF FILE"), std::string::npos);

  // The header states the range look count of the resolution asked for, and
  // one azimuth look: one output line per input line interval.
  const double inputLines =
      (TruthNumber(vor(), "Scene", "SensingStop") - TruthNumber(vor(), "Scene", "SensingStart")) /
          TruthNumber(vor(), "Scene", "LineTimeInterval") +
      1.0;
  EXPECT_EQ(Integer(ground, "NRangeLooks"), 3);
  EXPECT_EQ(Integer(slant, "NRangeLooks"), 5);
  for (const Fields* f : {&ground, &slant})
    EXPECT_EQ(Integer(*f, "NAzimuthLooks"),
              std::lround(inputLines / Integer(*f, "NrOfLinesPerImage")));
}

// The ground width of a long scene changes along it: on this descending
// pass the far edge moves by about 5 m a second.  With a fine ground step,
// and one look so that the composite keeps every input sample, that is
// several output samples over the scene.  The output is as wide as the
// widest line, and every line ends at its own far edge, the narrower ones
// in zeros.
TEST_F(MultilookCommand, GroundRangeKeepsTheFarEdgeOfEveryLine) {
  constexpr double kFineStep = 10.0;  // m
  constexpr long kMargin = 40;        // lines at either end that the burst taper darkens
  const SynthRun& run = scene("--size small --bursts 90 --pass descending");
  const MultilookRun m = runWith(run, "long", {{"GrSamplingStep", "10"}, {"GrResolution", "30"}},
                                 {{kGroundRange, kOK}});
  ExpectSuccess(m.outcome, m.args);
  const std::string output = m.args[kRoot] + "_gr";
  const Fields f = ReadSml(output + ".sml");
  const long lines = Integer(f, "NrOfLinesPerImage");
  const long samples = Integer(f, "NrOfPixelsPerLine");
  ASSERT_GT(lines, 2 * kMargin);
  const std::vector<float> image = Floats(output);
  ASSERT_EQ(image.size(), static_cast<size_t>(lines * samples));
  // The last sample of a line that holds data.
  auto lastData = [&](long line) {
    long k = samples - 1;
    while (k >= 0 && image[line * samples + k] == 0.0f) --k;
    return k;
  };
  // The generator's far edge of a line, in output samples.
  const double start = TruthNumber(run, "Scene", "SensingStart");
  const double interval = TruthNumber(run, "Scene", "LineTimeInterval");
  auto edge = [&](long line) {
    return SwathWidthOnGround(run, start + line * interval) / kFineStep;
  };
  const double first = edge(0), last = edge(lines - 1);
  ASSERT_GT(std::fabs(first - last), 8.0) << "the scene is too short to show the far edge move";
  EXPECT_NEAR(samples, std::max(first, last) + 1.0, 1.5);
  // Within about half an input sample of the last input sample's position.
  for (const long line : {kMargin, lines / 2, lines - 1 - kMargin}) {
    SCOPED_TRACE("line " + std::to_string(line));
    EXPECT_NEAR(lastData(line), edge(line), 1.5);
  }
}

// Products that begin and end with blank records, their time fields zero or
// nominal, multilook onto the same grid as the product without them.
TEST_F(MultilookCommand, BlankRecordsAtEitherEndMultilook) {
  ASSERT_EQ(groundRun().outcome.status, 0);
  const Fields plain = ReadSml(groundRun().args[kRoot] + "_gr.sml");
  for (const bool zero : {false, true}) {
    SCOPED_TRACE(zero ? "zero times" : "nominal times");
    // The whole first burst and the first line of the last one are blank.
    const SynthRun& run = scene(std::string("--size tiny --pass descending --blank-start 60 "
                                            "--blank-end 60") +
                                (zero ? " --blank-zero-time" : ""));
    const MultilookRun m =
        runWith(run, zero ? "blank_zero" : "blank_nominal", {}, {{kGroundRange, kOK}});
    ExpectSuccess(m.outcome, m.args);
    const Fields f = ExpectOutput(run, m.args[kRoot], true);
    EXPECT_EQ(Field(f, "NrOfLinesPerImage"), Field(plain, "NrOfLinesPerImage"));
    EXPECT_EQ(Field(f, "NrOfPixelsPerLine"), Field(plain, "NrOfPixelsPerLine"));
  }
}

// The antenna flag of the parameter file changes nothing.  The map-projected
// copy "<root>_geo.tif" is written only when the parameter file asks for it;
// map options that cannot make a map end the run before the multilook, with
// the reason in the error file.
TEST_F(MultilookCommand, ParameterFileSwitches) {
  const MultilookRun antenna = runWith(
      vor(), "antenna",
      {{"Sl2Gr", "1"}, {"RgAnt_flag", "1"}, {"GrResolution", std::to_string(kSlantResolution)}},
      {});
  ExpectSuccess(antenna.outcome, antenna.args);
  const std::string flagged = ReadFile(antenna.args[kRoot] + "_pwr");
  ASSERT_FALSE(flagged.empty());
  EXPECT_TRUE(flagged == ReadFile(slantRun().args[kRoot] + "_pwr"))
      << "the antenna correction changed the image";

  EXPECT_FALSE(Exists(groundRun().args[kRoot] + "_geo.tif"));
  const MultilookRun geocoded = runWith(vor(), "geocoded", {{"Geocode", "1"}},
                                        {{kGroundRange, kOK}, {kTiff, kOK}, {kSaturation, "2"}});
  ExpectSuccess(geocoded.outcome, geocoded.args);
  EXPECT_TRUE(Exists(geocoded.args[kRoot] + "_geo.tif"));
  EXPECT_TRUE(Exists(geocoded.args[kRoot] + "_geo.tif.sml"));
  // The other outputs are those of a run without it.
  EXPECT_TRUE(ReadFile(geocoded.args[kRoot] + "_gr") == ReadFile(groundRun().args[kRoot] + "_gr"));
}

TEST_F(MultilookCommand, TiffOpensInGdalWithControlPointsOnTheScene) {
  if (!vlr_test::HaveGdal()) GTEST_SKIP() << "gdal-bin is not installed";
  ASSERT_EQ(groundRun().outcome.status, 0) << groundRun().outcome.error;
  ASSERT_EQ(porRun().outcome.status, 0) << porRun().outcome.error;
  {
    SCOPED_TRACE("descending scene, DOR_VOR");
    ExpectTiff(vor(), groundRun().args[kRoot] + "_gr");
  }
  {
    SCOPED_TRACE("ascending scene, DOR_POR");
    ExpectTiff(por(), porRun().args[kRoot] + "_gr");
  }
  EXPECT_NE(groundRun().outcome.log.find("MAKE TIFF OF FILE [" + groundRun().args[kRoot] + "_gr]"),
            std::string::npos)
      << groundRun().outcome.log;
}

// The host withdraws the run (deletes "_batch_ok") while it shows a given
// phase: the run ends with 326400 and leaves none of the files it began,
// while the outputs of an earlier successful run under another root stay as
// they were.
TEST_F(MultilookCommand, AWithdrawnRunLeavesNothingBehind) {
  ASSERT_EQ(groundRun().outcome.status, 0) << groundRun().outcome.error;
  const std::string earlierDir = folder("ground");
  const std::map<std::string, std::string> earlier = vlr_test::FolderFiles(earlierDir);
  ASSERT_GT(earlier.size(), 20u);

  const struct {
    const char* what;
    const char* word;
    const char* phase;  // the working file's message or the process label
    int percent = 50;
    bool byTiffCheck = false;  // stopped by the check before the export
  } cases[] = {
      {"the import's extraction", kImport, "Extracting data..."},
      {"the multilook processing", kMultilook, "MULTILOOK PROCESSING"},
      {"the recomposition", kMultilook, "MULTILOOK SWATHS RECOMPOSITION"},
      {"the TIFF export", kMultilook, "Tiff generation ..."},
      {"the geocoding", kMultilook, "GEOCODING", 0, true},
  };
  parameters({{"Geocode", "1"}});
  int n = 0;
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    const std::string dir = folder("withdrawn" + std::to_string(++n));
    const bool import = std::string(c.word) != kMultilook;
    std::vector<std::string> args =
        import ? importArguments(vor(), dir + "R") : arguments(vor(), dir + "R");
    if (!import) args[kGroundRange] = args[kTiff] = kOK;
    useAuxiliaryListOf(vor());
    const Outcome o = vlr_test::RunAsHost(
        inst(), c.word, args, false,
        {{"VELORAN_TEST_WITHDRAW_AT", std::string(c.phase) + "@" + std::to_string(c.percent)}});
    vlr_test::ExpectFailureRecords(o, 326400, c.byTiffCheck ? "" : inst().workingFile() + "\n",
                                   import ? "Import ESA Products" : "Multilooking ASA WSS",
                                   "[ERROR ID : 326400]");
    EXPECT_EQ(vlr_test::FolderNames(dir), std::set<std::string>());
  }
  parameters({});
  EXPECT_TRUE(vlr_test::FolderFiles(earlierDir) == earlier) << "an earlier run's outputs changed";
  EXPECT_TRUE(Exists(vor().product));
}

// Opened by its own name, every output reads in GDAL as what it holds: the
// power images as the little-endian floats their headers state, the TIFF
// with 0 exactly at the null pixels of the image and its grey levels in the
// order of the image's amplitudes.
TEST_F(MultilookCommand, EveryOutputOpensInGdalByItsOwnName) {
  if (!vlr_test::HaveGdal()) GTEST_SKIP() << "gdal-bin is not installed";
  ASSERT_EQ(groundRun().outcome.status, 0) << groundRun().outcome.error;
  ASSERT_EQ(slantRun().outcome.status, 0) << slantRun().outcome.error;
  const std::string copy = folder("gdal") + "copy";
  for (const std::string& output :
       {groundRun().args[kRoot] + "_gr", slantRun().args[kRoot] + "_pwr"}) {
    SCOPED_TRACE(output);
    const Fields f = ReadSml(output + ".sml");
    ASSERT_EQ(Field(f, "CellType"), "FLOAT");
    EXPECT_TRUE(GdalCopy(output, copy) == synth_test::read_file(output))
        << "GDAL does not read the image's own floats";
  }

  const std::string image = groundRun().args[kRoot] + "_gr";
  const std::vector<float> values = Floats(image);
  const std::vector<uint8_t> grey = GdalCopy(image + ".tif", copy);
  ASSERT_EQ(grey.size(), values.size());
  std::vector<size_t> order;
  size_t nullMismatches = 0;
  for (size_t i = 0; i < values.size(); ++i) {
    if ((grey[i] == 0) != (values[i] == 0.0f)) ++nullMismatches;
    if (values[i] != 0.0f) order.push_back(i);
  }
  EXPECT_EQ(nullMismatches, 0u);
  ASSERT_GT(order.size(), values.size() / 2);
  std::sort(order.begin(), order.end(), [&](size_t a, size_t b) { return values[a] < values[b]; });
  size_t inversions = 0;
  for (size_t j = 1; j < order.size(); ++j)
    if (grey[order[j]] < grey[order[j - 1]]) ++inversions;
  EXPECT_EQ(inversions, 0u);
}

// One run per way either command ends early: the code, the error file, the
// record in Process.log, no output root, and nothing the run began left in
// its folder.
TEST_F(MultilookCommand, EveryFailureEndsWithItsCodeInTheRecords) {
  const SynthRun& run = vor();
  const std::string xca = run.dir + Truth(run, "Scene", "XcaFile");
  const std::string product = ReadFile(run.product);
  const std::string productName = Truth(run, "Scene", "Product");
  const std::string missingOrbit = folder("failures") + "DOR_VOR_AXVF-P_missing";
  using Prepare = std::function<void(const std::string& dir, std::vector<std::string>& args)>;
  struct Case {
    const char* word;  // the command
    const char* what;
    int code;
    std::string extra;    // text after "[EC : code]\n" in the error file
    std::string logText;  // text in Process.log
    Prepare prepare;      // readies the case in its folder (ends with '/')
  };
  auto argument = [](size_t at, const std::string& value) -> Prepare {
    return [=](const std::string&, std::vector<std::string>& a) { a[at] = value; };
  };
  auto parameter = [](const std::map<std::string, std::string>& edits) -> Prepare {
    return [=](const std::string&, std::vector<std::string>&) { parameters(edits); };
  };
  auto inTheWay = [](const std::string& name) -> Prepare {
    return [=](const std::string& dir, std::vector<std::string>&) {
      std::filesystem::create_directories(dir + name);
    };
  };
  // The product, under its own name in the case's folder, as these bytes.
  auto productOf = [&](const std::string& bytes) -> Prepare {
    return [=](const std::string& dir, std::vector<std::string>& a) {
      a[kProduct] = dir + productName;
      WriteFile(a[kProduct], bytes);
    };
  };
  const Prepare noValidAuxiliary = [&](const std::string&, std::vector<std::string>&) {
    WriteFile(desFolder() + "ASA_AUX_list.dat",
              "[ASA_XCA_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = 01-JAN-2001 00:00:00\n"
              "FileName = " +
                  Truth(run, "Scene", "XcaFile") + "\n");
  };
  const Prepare truncated =
      productOf(product.substr(0, std::stoul(Truth(run, SubSwath(3), "MdsOffset"))));
  std::string unknownPolarisation = product;
  unknownPolarisation[unknownPolarisation.find("MDS1_TX_RX_POLAR=\"") + 18] = 'X';
  const std::string orbitFolder = folder("failures");
  const Prepare calibrationAsProduct = [&](const std::string&, std::vector<std::string>& a) {
    a[kProduct] = a[kImportXca] = a[kImportIns] = xca;
  };
  const Case cases[] = {
      {kImport, "no product", 456962, "ASA_XXX\n", "\nINPUT ASA : [ NotOK ]",
       argument(kProduct, kNotOK)},
      // "NotOK" is compared whole: a longer text is a file name, here one
      // that does not exist.
      {kImport, "a product that does not open", 9, "", "File not opened!",
       argument(kProduct, "NotOKay")},
      {kImport, "a calibration file as product", 456962, "WSS\n",
       "Input file is not a ASA_WSS dataset", calibrationAsProduct},
      {kImport, "a missing orbit file", 9, "", "Orbit file " + missingOrbit + ": ",
       argument(kImportDoris, missingOrbit)},
      {kImport, "an orbit file that is a folder", 4, "", "Orbit file " + orbitFolder,
       argument(kImportDoris, orbitFolder)},
      {kImport, "a product cut inside its third sub-swath", 4, "", "file : images_v2", truncated},
      {kImport, "an output folder that is a file", 9, "", "File not opened!",
       argument(kImportRoot, xca + "/R")},
      {kImport, "a polarisation the conversion does not know", 1, "", "Wrong Polarization Type",
       productOf(unknownPolarisation)},
      {kMultilook, "no product", 456962, "WSS\n", "\nINPUT ASA_RS : [ NotOK ]",
       argument(kProduct, kNotOK)},
      {kMultilook, "a calibration file as product", 456962, "WSS\n", "INVALID INPUT",
       argument(kProduct, xca)},
      {kMultilook, "no output root", 456962, "OUTNAME\n", "OUTPUT ROOT NAME : [ NotOK ]",
       argument(kRoot, kNotOK)},
      {kMultilook, "no orbit", 456962, "DOR_VOR\n", "INPUT DORIS : [ NotOK ]",
       argument(kDoris, kNotOK)},
      {kMultilook, "a calibration file as orbit", 456962, "DOR_VOR\n", "INVALID INPUT",
       argument(kDoris, xca)},
      {kMultilook, "a missing orbit file", 456962, "DOR_VOR\n", "Orbit file " + missingOrbit + ": ",
       argument(kDoris, missingOrbit)},
      {kMultilook, "an orbit file that is a folder", 456962, "DOR_VOR\n",
       "Orbit file " + orbitFolder, argument(kDoris, orbitFolder)},
      {kMultilook, "no auxiliary file valid at the sensing start", 130560, "findaux()\n",
       "file : find_aux", noValidAuxiliary},
      {kMultilook, "a product cut inside its third sub-swath", 130560, "images run()\n",
       "file : images_v2", truncated},
      {kMultilook, "a polarisation the conversion does not know", 130560, "tessal2kestova()\n",
       "Wrong Polarization Type", productOf(unknownPolarisation)},
      {kMultilook, "a list file that cannot be created", 9, "", "File not opened!",
       inTheWay("R.list_tmp")},
      {kMultilook, "a parameter file without W1", 130560, "mlook conf readpar()\n",
       "PROCESSING STEP FAILED", parameter({{"W1", ""}})},
      {kMultilook, "a ground resolution out of range", 130560, "mlook conf checkpar()\n",
       "PROCESSING STEP FAILED", parameter({{"GrResolution", "5000"}})},
      {kMultilook, "more than 15 range looks", 130560, "mlook run()\n",
       "Number of estimated range looks must be lower than 15",
       parameter({{"GrResolution", "1000"}})},
      {kMultilook, "a processor header that cannot be written", 130560, "mlook writepar()\n",
       "PROCESSING STEP FAILED", inTheWay("R_pwr.hdr")},
      {kMultilook, "a suite header that cannot be written", 261124, "", "R_pwr.sml",
       inTheWay("R_pwr.sml")},
      // Map options that cannot make a map end the run before the multilook.
      {kMultilook, "a map code no projection has", 130560, "geocode(): EPSG code 99999",
       "EPSG code 99999 is unknown",
       [](const std::string&, std::vector<std::string>& a) {
         a[kGroundRange] = a[kTiff] = kOK;
         parameters({{"Geocode", "1"}, {"MapEPSG", "99999"}});
       }},
      // Thirteen arguments: the list file is named, and the last one read.
      {kMultilook, "thirteen arguments", 456962, inst().working() + "args.txt\n",
       " Parameter 12 (NotOK)\n",
       [](const std::string&, std::vector<std::string>& a) { a.pop_back(); }},
  };
  int n = 0;
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    const bool import = std::string(c.word) != kMultilook;
    const std::string dir = folder("failure" + std::to_string(++n));
    std::vector<std::string> args =
        import ? importArguments(run, dir + "R") : arguments(run, dir + "R");
    useAuxiliaryListOf(run);
    c.prepare(dir, args);
    const std::set<std::string> prepared = vlr_test::FolderNames(dir);
    const Outcome o = vlr_test::RunAsHost(inst(), c.word, args);
    vlr_test::ExpectFailureRecords(
        o, c.code, c.extra, import ? "Import ESA Products" : "Multilooking ASA WSS", c.logText);
    EXPECT_FALSE(Exists(args[import ? kImportRoot : kRoot]));
    // Nothing the run began is left: no list file, sub-swath, temporary or
    // partial output.
    EXPECT_EQ(vlr_test::FolderNames(dir), prepared);
    parameters({});
  }
}

}  // namespace
