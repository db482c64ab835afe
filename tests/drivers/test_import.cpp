// The import command end to end, run the way the host runs it: an
// installation, an argument-list file, the working file with "_batch_ok",
// then the tool's exit code, Process.log, the error file and the files it
// wrote, checked against the generator's truth and read back with python's
// XML parser and GDAL.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <future>
#include <map>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "host_run.h"
#include "truth_math.h"

using synth_test::SynthRun;
using vlr_test::Exists;
using vlr_test::Field;
using vlr_test::Number;
using vlr_test::Outcome;
using vlr_test::ReadFile;
using vlr_test::SubSwath;
using vlr_test::Truth;
using vlr_test::TruthNumber;
using vlr_test::WriteFile;

namespace {

constexpr const char* kImport = "main_import_ESA#";
constexpr const char* kNotOK = "NotOK";
constexpr int kSubSwaths = 5;
constexpr size_t kProduct = 0, kDoris = 1, kXca = 2, kRoot = 3, kIns = 4;
constexpr double kHalfSpeedOfLight = 149896229.0;
// Bytes of the time and quality prefix the extraction keeps on every line.
constexpr size_t kLinePrefix = 17;
// Size of a complex float sample in the rasters.
constexpr size_t kRasterSample = 8;
// The product states its first slant-range time as a 32-bit float of
// nanoseconds: half a nanosecond of range delay is 0.075 m.
constexpr double kSlantRangeTolerance = 0.1;
constexpr const char* kDescending = "--size tiny --pass descending";
constexpr const char* kAscending =
    "--size tiny --pass ascending --polarisation VV --seed 2 --blank-start 3 --blank-end 2";

vlr_test::SmlFields ReadSml(const std::string& sml) {
  return vlr_test::ReadSml(
      sml,
      "NrOfLinesPerImage,NrOfPixelsPerLine,AzimuthStartTime,AzimuthStopTime,SlantRange,"
      "PixelSpacingRg,PixelSpacingAz,Lines_per_burst,Bursts,Echoes_per_burst,Rank,PRFExtracted,"
      "nStateVectors,CellType,DataUnits,BytesOrder,RowPrefix,LatNorthing,LonEasting,SceneHeading,"
      "EnvisatTwoWayAntennaElevationPatternTableNbr,EnvisatReferenceElevationAngle,"
      "EnvisatTwoWayAntennaElevationPatternTable");
}

std::string Swath(const std::string& root, int k) {
  return root + std::to_string(k) + "_slc";
}

// Copies `product` to `path` with a first polarisation ("X/H") that no
// import accepts; the extraction copies it, the conversion refuses it.
void WriteWithUnknownPolarisation(const std::string& product, const std::string& path) {
  static const std::string kField = "MDS1_TX_RX_POLAR=\"";
  std::string bytes = ReadFile(product);
  const size_t at = bytes.find(kField);
  ASSERT_NE(at, std::string::npos) << product;
  bytes[at + kField.size()] = 'X';
  WriteFile(path, bytes);
}

struct ImportRun {
  std::vector<std::string> args;
  Outcome outcome;
};

class Import : public vlr_test::HostRunTest {
 protected:
  static const SynthRun& descending() { return scene(kDescending); }
  static const SynthRun& ascending() { return scene(kAscending); }
  // Exactly 14 arguments: the product, the orbit and the output root, the
  // rest "NotOK".
  static std::vector<std::string> arguments(const SynthRun& run, const std::string& orbit,
                                            const std::string& root) {
    std::vector<std::string> a(14, kNotOK);
    a[kProduct] = run.product;
    a[kDoris] = orbit;
    a[kRoot] = root;
    return a;
  }
  static Outcome runTool(const std::vector<std::string>& args) {
    return vlr_test::RunAsHost(inst(), kImport, args);
  }
  // Descending: the auxiliary files chosen from the list.
  static const ImportRun& descendingRun() {
    static const ImportRun r = [] {
      ImportRun i{arguments(descending(), orbitOf(descending()), folder("descending") + "R"), {}};
      useAuxiliaryListOf(descending());
      i.outcome = runTool(i.args);
      return i;
    }();
    return r;
  }
  // Ascending: the calibration and instrument files named by the host.
  static const ImportRun& ascendingRun() {
    static const ImportRun r = [] {
      ImportRun i{arguments(ascending(), orbitOf(ascending()), folder("ascending") + "R"), {}};
      i.args[kXca] = ascending().dir + Truth(ascending(), "Scene", "XcaFile");
      i.args[kIns] = ascending().dir + Truth(ascending(), "Scene", "InsFile");
      i.outcome = runTool(i.args);
      return i;
    }();
    return r;
  }
};

// A successful run: exit 0, the START record with the inputs, SUCCESSFUL and
// the END record, no error anywhere, the working file deleted.
void ExpectSuccess(const Outcome& o, const std::vector<std::string>& args) {
  vlr_test::ExpectSuccessRecords(o, "Import ESA Products",
                                 "\nINPUT ASA : [ " + args[kProduct] + " ]\nINPUT DORIS : [ " +
                                     args[kDoris] + " ]\nINPUT ASA_XCA : [ " + args[kXca] +
                                     " ]\nOUTPUT ROOT NAME : [ " + args[kRoot] + " ]");
}

// The two-way elevation pattern of sub-swath section `s` in its suite
// header: gains 10^(dB/20) at 0.05-degree steps about the reference angle,
// against the parabola in dB that the generator wrote into the product's
// pattern record, over the sub-swath's own span of look angles.
void ExpectElevationPattern(const SynthRun& run, const std::string& s,
                            const vlr_test::SmlFields& f) {
  const long count = std::lround(Number(f, "EnvisatTwoWayAntennaElevationPatternTableNbr"));
  ASSERT_GE(count, 3);
  ASSERT_EQ(count % 2, 1);
  const double reference = Number(f, "EnvisatReferenceElevationAngle");
  EXPECT_NEAR(reference, TruthNumber(run, s, "CentreLookAngle"), 0.1);
  const double slot = TruthNumber(run, s, "XcaSlot");
  const double centre =
      TruthNumber(run, "Calibration", "ReferenceAngleSS" + s.substr(s.size() - 1));
  const std::string table = Field(f, "EnvisatTwoWayAntennaElevationPatternTable");
  ASSERT_EQ(std::count(table.begin(), table.end(), '|'), count - 1);
  for (long i = 0; i < count; ++i) {
    const double offset = reference + (i - (count - 1) / 2) * 0.05 - centre;
    const double db = -(0.75 + 0.05 * slot) * offset * offset;
    const double gain = Number(f, "EnvisatTwoWayAntennaElevationPatternTable", i);
    ASSERT_NEAR(gain, std::pow(10.0, db / 20.0), 1e-6) << "value " << i << " of " << count;
  }
}

// Distance in metres between the point a header states (latitude, longitude
// fields) and a truth point.
double Off(const vlr_test::SmlFields& f, const std::string& lat, const std::string& lon,
           double trueLat, double trueLon) {
  return truth::SurfaceDistance(Number(f, lat), Number(f, lon), trueLat, trueLon);
}

// The list file and the five sub-swaths of an import over `root` against
// the generator's truth.  Without an orbit there are no state vectors,
// corners, centre or azimuth spacing.
void ExpectSubSwaths(const SynthRun& run, const std::string& root, bool withOrbit) {
  std::string list;
  for (int k = 1; k <= kSubSwaths; ++k) list += Swath(root, k) + "\n";
  EXPECT_EQ(ReadFile(root), list);
  const bool ascending = Truth(run, "Scene", "Pass") == "ASCENDING";
  for (int k = 1; k <= kSubSwaths; ++k) {
    SCOPED_TRACE("sub-swath " + std::to_string(k));
    const std::string s = SubSwath(k);
    const std::string raster = Swath(root, k);
    const long samples = std::lround(TruthNumber(run, s, "Samples"));
    const long records = std::lround(TruthNumber(run, s, "Records"));

    // The raster moved to its final name, with its suite header and the
    // virtual raster that GDAL reads it through.
    EXPECT_FALSE(Exists(root + std::to_string(k)));
    struct stat st {};
    ASSERT_EQ(stat(raster.c_str(), &st), 0);
    EXPECT_EQ(static_cast<long>(st.st_size), records * long(kLinePrefix + kRasterSample * samples));
    EXPECT_TRUE(Exists(raster + ".vrt"));

    const vlr_test::SmlFields f = ReadSml(raster + ".sml");
    EXPECT_EQ(Field(f, "CellType"), "FLOAT_COMPLEX");
    EXPECT_EQ(Field(f, "DataUnits"), "SLC");
    EXPECT_EQ(Field(f, "BytesOrder"), "LSBF");
    EXPECT_EQ(Number(f, "RowPrefix"), double(kLinePrefix));

    // Timing and sampling.
    EXPECT_NEAR(truth::Sec85(Field(f, "AzimuthStartTime")), TruthNumber(run, s, "FirstLineTime"),
                2e-6)
        << Field(f, "AzimuthStartTime") << " against " << Truth(run, s, "FirstLineTimeText");
    EXPECT_NEAR(truth::Sec85(Field(f, "AzimuthStopTime")), TruthNumber(run, s, "LastLineTime"),
                2e-6)
        << Field(f, "AzimuthStopTime") << " against " << Truth(run, s, "LastLineTimeText");
    const double nearRange = TruthNumber(run, s, "NearRangeTime") * kHalfSpeedOfLight;
    const double farRange = TruthNumber(run, s, "FarRangeTime") * kHalfSpeedOfLight;
    EXPECT_NEAR(Number(f, "SlantRange", 0), nearRange, kSlantRangeTolerance);
    EXPECT_NEAR(Number(f, "SlantRange", 1), 0.5 * (nearRange + farRange), kSlantRangeTolerance);
    EXPECT_NEAR(Number(f, "SlantRange", 2), farRange, kSlantRangeTolerance);
    const struct {
      const char* field;
      const char* truth;
      double tolerance;
    } counts[] = {{"NrOfLinesPerImage", "Records", 0},       {"NrOfPixelsPerLine", "Samples", 0},
                  {"PixelSpacingRg", "RangeSpacing", 1e-6},  {"PRFExtracted", "PRF", 1e-6},
                  {"Lines_per_burst", "LinesPerBurst", 0},   {"Bursts", "Bursts", 0},
                  {"Echoes_per_burst", "EchoesPerBurst", 0}, {"Rank", "Rank", 0}};
    for (const auto& c : counts)
      EXPECT_NEAR(Number(f, c.field), TruthNumber(run, s, c.truth), c.tolerance) << c.field;
    EXPECT_EQ(Field(f, "OtherInfo.SCENE DATA"), "ENVISAT-1|ENVISAT_WSS|SS" + std::to_string(k) +
                                                    "|" + Truth(run, "Scene", "Polarisation") +
                                                    "|" + Truth(run, "Scene", "Pass") +
                                                    "|SLANT_RANGE");
    EXPECT_EQ(Field(f, "OtherInfo.ORIGIN DATA"), "ENVISAT_WSM");
    ExpectElevationPattern(run, s, f);

    if (!withOrbit) {
      EXPECT_EQ(Number(f, "nStateVectors"), 0.0);
      EXPECT_EQ(Number(f, "SceneHeading"), -999.0);
      EXPECT_EQ(Field(f, "PixelSpacingAz"), "");
      EXPECT_EQ(f.count("OtherInfo.CORNER POINT 1  X"), 0u);
      EXPECT_EQ(f.count("OtherInfo.UTM_ZONE"), 0u);
      continue;
    }
    EXPECT_GT(Number(f, "nStateVectors"), 0.0);
    // One line interval at the ground speed of the beam, which the generator
    // states for the scene centre.
    EXPECT_NEAR(Number(f, "PixelSpacingAz"), TruthNumber(run, "Scene", "AzimuthSpacing"),
                0.01 * TruthNumber(run, "Scene", "AzimuthSpacing"));

    // The corners are numbered round the footprint by compass point:
    // 3 north-west, 4 north-east, 2 south-west, 1 south-east.  The radar
    // looks right, so a descending pass starts in the north with near range
    // to the east, an ascending one starts in the south with near range to
    // the west.
    const struct {
      const char* number;
      const char* descending;
      const char* ascending;
    } corners[] = {{"3", "FirstFar", "LastNear"},
                   {"4", "FirstNear", "LastFar"},
                   {"2", "LastFar", "FirstNear"},
                   {"1", "LastNear", "FirstFar"}};
    for (const auto& c : corners) {
      const std::string corner = ascending ? c.ascending : c.descending;
      const std::string key = std::string("OtherInfo.CORNER POINT ") + c.number + "  ";
      EXPECT_LT(Off(f, key + "Y", key + "X", TruthNumber(run, s, corner + "Lat"),
                    TruthNumber(run, s, corner + "Lon")),
                1.0)
          << "corner " << c.number << " against " << corner;
    }
    // The centre of the image and the heading of the ground track there.
    const double lat = TruthNumber(run, s, "CentreLat");
    const double lon = TruthNumber(run, s, "CentreLon");
    EXPECT_LT(Off(f, "OtherInfo.CENTER SCENE POINT Y", "OtherInfo.CENTER SCENE POINT X", lat, lon),
              1.0);
    EXPECT_NEAR(Number(f, "SceneHeading"), TruthNumber(run, s, "CentreHeading"), 0.1);
    EXPECT_LT(Off(f, "LatNorthing", "LonEasting", lat, lon), 1.0);
    EXPECT_EQ(Field(f, "OtherInfo.UTM_HEMISPHERE"), lat >= 0.0 ? "NORTH" : "SOUTH");
    EXPECT_EQ(Field(f, "OtherInfo.UTM_ZONE"),
              std::to_string(1 + static_cast<int>(std::floor((lon + 180.0) / 6.0))));
  }
}

// GDAL, through the virtual raster beside each sub-swath, reads exactly the
// samples of the product's measurement data set: big-endian 16-bit I and Q
// as floats.  Given the sub-swath raster by its own name, GDAL reads the
// same samples or refuses to open it, never another image.
void ExpectGdalReadsTheProductSamples(const SynthRun& run, const std::string& root,
                                      const std::string& scratch) {
  const std::vector<uint8_t> product = synth_test::read_file(run.product);
  for (int k = 1; k <= kSubSwaths; ++k) {
    SCOPED_TRACE("sub-swath " + std::to_string(k));
    const std::string s = SubSwath(k);
    const size_t samples = static_cast<size_t>(TruthNumber(run, s, "Samples"));
    const size_t records = static_cast<size_t>(TruthNumber(run, s, "Records"));
    const size_t offset = static_cast<size_t>(TruthNumber(run, s, "MdsOffset"));
    const size_t recordSize = static_cast<size_t>(TruthNumber(run, s, "RecordSize"));
    ASSERT_EQ(recordSize, kLinePrefix + 4 * samples);
    ASSERT_LE(offset + recordSize * records, product.size());
    const std::string raw = scratch + "gdal_" + std::to_string(k) + ".bin";
    ASSERT_EQ(
        synth_test::shell("gdal_translate -q -of ENVI '" + Swath(root, k) + ".vrt' '" + raw + "'"),
        0);
    const std::vector<uint8_t> out = synth_test::read_file(raw);
    ASSERT_EQ(out.size(), records * samples * kRasterSample);
    size_t mismatches = 0;
    for (size_t r = 0; r < records; ++r) {
      const uint8_t* in = product.data() + offset + recordSize * r + kLinePrefix;
      for (size_t i = 0; i < 2 * samples; ++i) {
        float v;
        std::memcpy(&v, out.data() + (r * 2 * samples + i) * sizeof(float), sizeof(float));
        if (v != static_cast<float>(synth_test::be16(in + 2 * i))) ++mismatches;
      }
    }
    EXPECT_EQ(mismatches, 0u);

    const std::string byName = raw + ".by_name";
    if (synth_test::shell("gdal_translate -q -of ENVI '" + Swath(root, k) + "' '" + byName +
                          "' 2> /dev/null") == 0) {
      EXPECT_TRUE(synth_test::read_file(byName) == out) << "GDAL reads another image";
    }
  }
}

// Descending with its orbit and the listed auxiliary files, ascending with
// blank records and named ones, and the descending one without an orbit,
// which leaves the sub-swaths without geography.
TEST_F(Import, SubSwathsMatchTheGeneratorsTruth) {
  ExpectSuccess(descendingRun().outcome, descendingRun().args);
  ExpectSubSwaths(descending(), descendingRun().args[kRoot], true);
  ExpectSuccess(ascendingRun().outcome, ascendingRun().args);
  ExpectSubSwaths(ascending(), ascendingRun().args[kRoot], true);

  useAuxiliaryListOf(descending());
  const std::vector<std::string> args = arguments(descending(), kNotOK, folder("no_orbit") + "R");
  ExpectSuccess(runTool(args), args);
  ExpectSubSwaths(descending(), args[kRoot], false);
}

TEST_F(Import, GdalReadsTheProductSamplesThroughTheVirtualRasters) {
  if (!vlr_test::HaveGdal()) GTEST_SKIP() << "gdal-bin is not installed";
  ASSERT_EQ(descendingRun().outcome.status, 0);
  ASSERT_EQ(ascendingRun().outcome.status, 0);
  ExpectGdalReadsTheProductSamples(descending(), descendingRun().args[kRoot], folder("gdal"));
  ExpectGdalReadsTheProductSamples(ascending(), ascendingRun().args[kRoot], folder("gdal"));
}

TEST_F(Import, ASecondImportOverTheSameRootReplacesEverything) {
  const SynthRun& first = descending();
  const SynthRun& second = scene("--size small --seed 4");
  ASSERT_NE(TruthNumber(first, SubSwath(1), "Records"),
            TruthNumber(second, SubSwath(1), "Records"));
  const std::string dir = folder("twice");
  const std::string root = dir + "R";
  useAuxiliaryListOf(first);
  ExpectSuccess(runTool(arguments(first, orbitOf(first), root)),
                arguments(first, orbitOf(first), root));
  useAuxiliaryListOf(second);
  const std::vector<std::string> args = arguments(second, orbitOf(second), root);
  ExpectSuccess(runTool(args), args);
  ExpectSubSwaths(second, root, true);
  // Nothing else is left in the folder: the library headers R1.hdr..R5.hdr
  // and their antenna pattern rasters stay beside the converted sub-swaths.
  std::set<std::string> expected = {"R"};
  for (int k = 1; k <= kSubSwaths; ++k) {
    for (const char* suffix : {".hdr", "_pattern", "_slc", "_slc.sml", "_slc.vrt"})
      expected.insert("R" + std::to_string(k) + suffix);
  }
  EXPECT_EQ(vlr_test::FolderNames(dir), expected);

  // An import over the same root that fails takes the list file with it, so
  // the host never reads a list naming rasters of two different products.
  std::vector<std::string> failing = args;
  failing[kProduct] = folder("twice_bad") + "bad.N1";
  WriteWithUnknownPolarisation(second.product, failing[kProduct]);
  vlr_test::ExpectFailureRecords(runTool(failing), 1, "", "Import ESA Products",
                                 "Wrong Polarization Type");
  EXPECT_FALSE(Exists(root));
}

// Two host runs, each with its own working folder and working file, and two
// runs of the command line, which keeps its process log as R.log: side by
// side they write what they write one after another, and each log holds its
// own run only.
TEST_F(Import, RunsSideBySideMatchRunsOneAfterAnother) {
  useAuxiliaryListOf(descending());
  constexpr int kRuns = 4;
  std::vector<std::vector<std::string>> runs;
  for (int i = 0; i < kRuns; ++i) {
    const SynthRun& product = i % 2 == 0 ? descending() : ascending();
    runs.push_back(i % 2 == 0 ? descendingRun().args : ascendingRun().args);
    runs[i][kRoot] = folder("side_" + std::to_string(i)) + "R";
    runs[i][kXca] = product.dir + Truth(product, "Scene", "XcaFile");
    runs[i][kIns] = product.dir + Truth(product, "Scene", "InsFile");
  }
  // The outcome holds the run's whole process log; runs 2 and 3 use the
  // command line.
  auto start = [](const std::vector<std::string>& a, int i) {
    Outcome o;
    const std::string work = folder("side_work_" + std::to_string(i));
    if (i >= 2) {
      o.status = vlr_test::RunProgram({vlr_test::ToolPath(), "import", a[kProduct], "-o", a[kRoot],
                                       "--orbit", a[kDoris], "--xca", a[kXca], "--ins", a[kIns]},
                                      {{"VELORAN_INIT_DIR", ""}}, true)
                     .status;
      o.log = ReadFile(a[kRoot] + ".log");
      return o;
    }
    const std::string working = work + "Process.working";
    WriteFile(working, "0\nStarting\n");
    WriteFile(working + "_batch_ok", "");
    std::remove((work + "Process.log").c_str());
    o.status = inst()
                   .run(std::string(kImport) + inst().writeArguments(a, "side" + std::to_string(i)),
                        {{"VELORAN_WORKING_DIR", work}, {"VELORAN_WORKING_FILE", working}})
                   .status;
    o.log = ReadFile(work + "Process.log");
    o.error = ReadFile(working + "_error");
    o.workingFileLeft = Exists(working);
    return o;
  };
  // The outputs, without the command line's log, which holds local times.
  auto outputs = [](const std::vector<std::string>& a) {
    const std::string dir = std::filesystem::path(a[kRoot]).parent_path().string();
    auto files = vlr_test::FolderFiles(dir);
    files.erase("R.log");
    std::filesystem::remove_all(dir);
    std::filesystem::create_directories(dir);
    return files;
  };
  std::vector<std::map<std::string, std::string>> oneAfterAnother;
  for (int i = 0; i < kRuns; ++i) {
    ExpectSuccess(start(runs[i], i), runs[i]);
    oneAfterAnother.push_back(outputs(runs[i]));
  }
  std::vector<std::future<Outcome>> started;
  for (int i = 0; i < kRuns; ++i)
    started.push_back(std::async(std::launch::async, start, runs[i], i));
  for (int i = 0; i < kRuns; ++i) {
    SCOPED_TRACE("run " + std::to_string(i));
    const Outcome o = started[i].get();
    ExpectSuccess(o, runs[i]);
    EXPECT_EQ(o.log.find("\nSTART : "), o.log.rfind("\nSTART : ")) << o.log;
    for (int j = 0; j < kRuns; ++j) {
      if (j != i) {
        EXPECT_EQ(o.log.find(runs[j][kRoot]), std::string::npos) << o.log;
      }
    }
    EXPECT_TRUE(outputs(runs[i]) == oneAfterAnother[i]) << "differs from the run one after another";
  }
}

}  // namespace
