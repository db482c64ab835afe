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
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <future>
#include <map>
#include <memory>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "host_run.h"
#include "installation.h"
#include "synth_run.h"

using synth_test::SynthRun;
using vlr_test::Exists;
using vlr_test::ReadFile;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

constexpr const char* kImport = "main_import_ESA#";
constexpr const char* kNotOK = "NotOK";
constexpr int kSubSwaths = 5;
constexpr size_t kArguments = 14;
constexpr size_t kProduct = 0, kDoris = 1, kXca = 2, kRoot = 3, kIns = 4;
constexpr double kHalfSpeedOfLight = 149896229.0;
// Bytes of the time and quality prefix the extraction keeps on every line.
constexpr size_t kLinePrefix = 17;
// Size of a complex float sample in the rasters.
constexpr size_t kRasterSample = 8;
// The product states its first slant-range time as a 32-bit float of
// nanoseconds: half a nanosecond of range delay is 0.075 m.
constexpr double kSlantRangeTolerance = 0.1;

// The fields of a ".sml" header that the tests read.
constexpr const char* kSmlFields =
    "NrOfLinesPerImage,NrOfPixelsPerLine,AzimuthStartTime,AzimuthStopTime,SlantRange,"
    "PixelSpacingRg,PixelSpacingAz,Lines_per_burst,Bursts,Echoes_per_burst,Rank,PRFExtracted,"
    "nStateVectors,CellType,DataUnits,BytesOrder,RowPrefix,LatNorthing,LonEasting,SceneHeading,"
    "EnvisatTwoWayAntennaElevationPatternTableNbr,EnvisatReferenceElevationAngle,"
    "EnvisatTwoWayAntennaElevationPatternTable";

using Fields = vlr_test::SmlFields;
using vlr_test::Field;

Fields ReadSml(const std::string& sml) {
  return vlr_test::ReadSml(sml, kSmlFields);
}

double Number(const Fields& f, const std::string& name, size_t element = 0) {
  std::string text = Field(f, name);
  for (size_t i = 0; i < element; ++i)
    text = text.substr(std::min(text.size(), text.find('|') + 1));
  return text.empty() ? std::nan("") : std::atof(text.c_str());
}

// Seconds since 01-JAN-1985 of "DD-MMM-YYYY HH:MM:SS[.ffffff]"; NaN when the
// text is no such date.
double Sec85(const std::string& text) {
  static const char* kMonths[] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                  "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
  int day = 0, year = 0, hour = 0, minute = 0;
  char month[4] = {};
  double second = 0.0;
  if (std::sscanf(text.c_str(), "%2d-%3c-%4d %2d:%2d:%lf", &day, month, &year, &hour, &minute,
                  &second) != 6)
    return std::nan("");
  int m = 0;
  while (m < 12 && std::strcmp(month, kMonths[m]) != 0) ++m;
  if (m == 12) return std::nan("");
  // Days from the civil date (proleptic Gregorian), 1970-01-01 = 0.
  const int y = year - (m < 2 ? 1 : 0);
  const int era = (y >= 0 ? y : y - 399) / 400;
  const int yoe = y - era * 400;
  const int mp = (m + 10) % 12;
  const int doy = (153 * mp + 2) / 5 + day - 1;
  const long days = era * 146097L + yoe * 365 + yoe / 4 - yoe / 100 + doy - 719468;
  constexpr long kDays1985 = 5479;
  return (days - kDays1985) * 86400.0 + hour * 3600.0 + minute * 60.0 + second;
}

// Straight-line distance in metres between two points of the WGS84
// ellipsoid surface given in degrees.
double Distance(double lat1, double lon1, double lat2, double lon2) {
  constexpr double a = 6378137.0, b = 6356752.314245;
  constexpr double e2 = 1.0 - (b * b) / (a * a);
  auto cartesian = [&](double lat, double lon, double* p) {
    const double phi = lat * M_PI / 180.0, lambda = lon * M_PI / 180.0;
    const double n = a / std::sqrt(1.0 - e2 * std::sin(phi) * std::sin(phi));
    p[0] = n * std::cos(phi) * std::cos(lambda);
    p[1] = n * std::cos(phi) * std::sin(lambda);
    p[2] = n * (1.0 - e2) * std::sin(phi);
  };
  double p[3], q[3];
  cartesian(lat1, lon1, p);
  cartesian(lat2, lon2, q);
  return std::sqrt((p[0] - q[0]) * (p[0] - q[0]) + (p[1] - q[1]) * (p[1] - q[1]) +
                   (p[2] - q[2]) * (p[2] - q[2]));
}

std::string Truth(const SynthRun& run, const std::string& section, const std::string& key) {
  const auto s = run.truth.find(section);
  if (s == run.truth.end() || s->second.count(key) == 0) return "<missing " + key + ">";
  return s->second.at(key);
}
double TruthNumber(const SynthRun& run, const std::string& section, const std::string& key) {
  return synth_test::truth_number(run.truth, section, key);
}
std::string SubSwath(int k) {
  return "SubSwath" + std::to_string(k);
}
std::string Swath(const std::string& root, int k) {
  return root + std::to_string(k) + "_slc";
}

bool HaveGdal() {
  return synth_test::shell("command -v gdal_translate > /dev/null 2>&1") == 0;
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

using vlr_test::Outcome;

class Import : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    inst_ = new TempInstallation();
    char pattern[] = "/tmp/vlr_import_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    scratch_ = std::string(pattern) + "/";
    descending_ = new SynthRun(synth_test::run_synth("--size tiny --pass descending"));
    ascending_ = new SynthRun(synth_test::run_synth(
        "--size tiny --pass ascending --polarisation VV --seed 2 --blank-start 3 --blank-end 2"));
    ASSERT_EQ(descending_->exit_code, 0);
    ASSERT_EQ(ascending_->exit_code, 0);
    // Both scenes follow the real DORIS orbit.
    ASSERT_EQ(Truth(*descending_, "Scene", "OrbitSource").rfind("real", 0), 0u);
    ASSERT_EQ(Truth(*ascending_, "Scene", "OrbitSource").rfind("real", 0), 0u);

    // Descending: the auxiliary files chosen from the list.  Ascending: the
    // calibration and instrument files named by the host.
    descendingArgs_ = arguments(*descending_, orbitOf(*descending_), folder("descending") + "R");
    useAuxiliaryListOf(*descending_);
    descendingRun_ = runTool(descendingArgs_);
    ascendingArgs_ = arguments(*ascending_, orbitOf(*ascending_), folder("ascending") + "R");
    ascendingArgs_[kXca] = ascending_->dir + Truth(*ascending_, "Scene", "XcaFile");
    ascendingArgs_[kIns] = ascending_->dir + Truth(*ascending_, "Scene", "InsFile");
    ascendingRun_ = runTool(ascendingArgs_);
    ready_ = true;
  }
  static void TearDownTestSuite() {
    for (SynthRun* r : {descending_, ascending_}) {
      if (r != nullptr) synth_test::remove_run(*r);
      delete r;
    }
    descending_ = ascending_ = nullptr;
    std::error_code ec;
    std::filesystem::remove_all(scratch_, ec);
    delete inst_;
    inst_ = nullptr;
    ready_ = false;
  }
  // A suite whose products could not be made runs none of its tests.
  void SetUp() override { ASSERT_TRUE(ready_) << "the generated products are missing"; }

  static std::string orbitOf(const SynthRun& run) {
    return run.dir + Truth(run, "Scene", "OrbitFile");
  }
  // Exactly 14 arguments: the product, the orbit and the output root, the
  // rest "NotOK".
  static std::vector<std::string> arguments(const SynthRun& run, const std::string& orbit,
                                            const std::string& root) {
    std::vector<std::string> a(kArguments, kNotOK);
    a[kProduct] = run.product;
    a[kDoris] = orbit;
    a[kRoot] = root;
    return a;
  }
  // A new empty folder under the scratch folder; ends with '/'.
  static std::string folder(const std::string& name) {
    const std::string path = scratch_ + name + "/";
    std::filesystem::create_directories(path);
    return path;
  }
  static std::string desFolder() { return inst_->root() + "/des/"; }
  // Puts the generator's auxiliary list and files where the import looks.
  static void useAuxiliaryListOf(const SynthRun& run) {
    ASSERT_EQ(synth_test::shell("cp " + run.dir + "ASA_AUX_list.dat " + run.dir + "ASA_XCA_* " +
                                run.dir + "ASA_INS_* " + desFolder()),
              0);
  }

  // Runs the import as the host does and collects what it left.
  static Outcome runTool(const std::vector<std::string>& args) {
    return vlr_test::RunAsHost(*inst_, kImport, args);
  }

  static bool ready_;
  static TempInstallation* inst_;
  static std::string scratch_;
  static SynthRun* descending_;
  static SynthRun* ascending_;
  static std::vector<std::string> descendingArgs_, ascendingArgs_;
  static Outcome descendingRun_, ascendingRun_;
};

bool Import::ready_ = false;
TempInstallation* Import::inst_ = nullptr;
std::string Import::scratch_;
SynthRun* Import::descending_ = nullptr;
SynthRun* Import::ascending_ = nullptr;
std::vector<std::string> Import::descendingArgs_, Import::ascendingArgs_;
Outcome Import::descendingRun_, Import::ascendingRun_;

// A successful run: exit 0, the START record with the inputs, SUCCESSFUL and
// the END record, no error anywhere, the working file deleted.
void ExpectSuccess(const Outcome& o, const std::vector<std::string>& args) {
  vlr_test::ExpectSuccessRecords(o, "Import ESA Products",
                                 "\nINPUT ASA : [ " + args[kProduct] + " ]\nINPUT DORIS : [ " +
                                     args[kDoris] + " ]\nINPUT ASA_XCA : [ " + args[kXca] +
                                     " ]\nOUTPUT ROOT NAME : [ " + args[kRoot] + " ]");
}

// A failed run: its code as exit status (255 for codes beyond a byte), the
// error file naming the code and `extra`, the ERROR record, no SUCCESSFUL,
// and no list file at the output root.  Over a `fresh` root (no earlier
// run's outputs) nothing named after the root is left at all.
void ExpectFailure(const Outcome& o, int code, const std::string& extra, const std::string& logText,
                   const std::string& root, bool fresh = true) {
  vlr_test::ExpectFailureRecords(o, code, extra, "Import ESA Products", logText);
  EXPECT_FALSE(Exists(root)) << root;
  if (!fresh) return;
  const std::filesystem::path r(root);
  for (const std::string& name : vlr_test::FolderNames(r.parent_path().string()))
    EXPECT_NE(name.rfind(r.filename().string(), 0), 0u) << name << " left beside " << root;
}

// The two-way elevation pattern of sub-swath section `s` in its suite
// header: gains 10^(dB/20) at 0.05-degree steps about the reference angle,
// against the parabola in dB that the generator wrote into the product's
// pattern record, over the sub-swath's own span of look angles.
void ExpectElevationPattern(const SynthRun& run, const std::string& s, const Fields& f) {
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

    const Fields f = ReadSml(raster + ".sml");
    EXPECT_EQ(Number(f, "NrOfLinesPerImage"), records);
    EXPECT_EQ(Number(f, "NrOfPixelsPerLine"), samples);
    EXPECT_EQ(Field(f, "CellType"), "FLOAT_COMPLEX");
    EXPECT_EQ(Field(f, "DataUnits"), "SLC");
    EXPECT_EQ(Field(f, "BytesOrder"), "LSBF");
    EXPECT_EQ(Number(f, "RowPrefix"), double(kLinePrefix));

    // Timing and sampling.
    EXPECT_NEAR(Sec85(Field(f, "AzimuthStartTime")), TruthNumber(run, s, "FirstLineTime"), 2e-6)
        << Field(f, "AzimuthStartTime") << " against " << Truth(run, s, "FirstLineTimeText");
    EXPECT_NEAR(Sec85(Field(f, "AzimuthStopTime")), TruthNumber(run, s, "LastLineTime"), 2e-6)
        << Field(f, "AzimuthStopTime") << " against " << Truth(run, s, "LastLineTimeText");
    const double nearRange = TruthNumber(run, s, "NearRangeTime") * kHalfSpeedOfLight;
    const double farRange = TruthNumber(run, s, "FarRangeTime") * kHalfSpeedOfLight;
    EXPECT_NEAR(Number(f, "SlantRange", 0), nearRange, kSlantRangeTolerance);
    EXPECT_NEAR(Number(f, "SlantRange", 1), 0.5 * (nearRange + farRange), kSlantRangeTolerance);
    EXPECT_NEAR(Number(f, "SlantRange", 2), farRange, kSlantRangeTolerance);
    EXPECT_NEAR(Number(f, "PixelSpacingRg"), TruthNumber(run, s, "RangeSpacing"), 1e-6);
    EXPECT_NEAR(Number(f, "PRFExtracted"), TruthNumber(run, s, "PRF"), 1e-6);
    EXPECT_EQ(Number(f, "Lines_per_burst"), TruthNumber(run, s, "LinesPerBurst"));
    EXPECT_EQ(Number(f, "Bursts"), TruthNumber(run, s, "Bursts"));
    EXPECT_EQ(Number(f, "Echoes_per_burst"), TruthNumber(run, s, "EchoesPerBurst"));
    EXPECT_EQ(Number(f, "Rank"), TruthNumber(run, s, "Rank"));

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
    const double azimuthSpacing = Number(f, "PixelSpacingAz");
    EXPECT_GT(azimuthSpacing, 60.0);
    EXPECT_LT(azimuthSpacing, 90.0);
    EXPECT_NEAR(azimuthSpacing, TruthNumber(run, "Scene", "AzimuthSpacing"),
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
      EXPECT_LT(Distance(Number(f, key + "Y"), Number(f, key + "X"),
                         TruthNumber(run, s, corner + "Lat"), TruthNumber(run, s, corner + "Lon")),
                1.0)
          << "corner " << c.number << " against " << corner;
    }
    // The centre of the image and the heading of the ground track there.
    const double lat = TruthNumber(run, s, "CentreLat");
    const double lon = TruthNumber(run, s, "CentreLon");
    EXPECT_LT(Distance(Number(f, "OtherInfo.CENTER SCENE POINT Y"),
                       Number(f, "OtherInfo.CENTER SCENE POINT X"), lat, lon),
              1.0);
    EXPECT_NEAR(Number(f, "SceneHeading"), TruthNumber(run, s, "CentreHeading"), 0.1);
    EXPECT_LT(Distance(Number(f, "LatNorthing"), Number(f, "LonEasting"), lat, lon), 1.0);
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

TEST_F(Import, DescendingHorizontalProductWithItsOrbitAndListedAuxiliaries) {
  ExpectSuccess(descendingRun_, descendingArgs_);
  ExpectSubSwaths(*descending_, descendingArgs_[kRoot], true);
}

TEST_F(Import, AscendingVerticalProductWithBlankRecordsAndNamedAuxiliaries) {
  ExpectSuccess(ascendingRun_, ascendingArgs_);
  ExpectSubSwaths(*ascending_, ascendingArgs_[kRoot], true);
}

TEST_F(Import, GdalReadsTheProductSamplesThroughTheVirtualRasters) {
  if (!HaveGdal()) GTEST_SKIP() << "gdal-bin is not installed";
  ASSERT_EQ(descendingRun_.status, 0);
  ASSERT_EQ(ascendingRun_.status, 0);
  ExpectGdalReadsTheProductSamples(*descending_, descendingArgs_[kRoot], folder("gdal"));
  ExpectGdalReadsTheProductSamples(*ascending_, ascendingArgs_[kRoot], folder("gdal"));
}

TEST_F(Import, WithoutOrbitTheSubSwathsHaveNoGeography) {
  useAuxiliaryListOf(*descending_);
  const std::vector<std::string> args = arguments(*descending_, kNotOK, folder("no_orbit") + "R");
  const Outcome o = runTool(args);
  ExpectSuccess(o, args);
  ExpectSubSwaths(*descending_, args[kRoot], false);
}

TEST_F(Import, AuxiliaryFileChosenByTheSensingStart) {
  const SynthRun& run = *descending_;
  useAuxiliaryListOf(run);
  const std::string start = Truth(run, "Scene", "SensingStartText");
  const std::string xca = Truth(run, "Scene", "XcaFile");
  const std::string ins =
      "[ASA_INS_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = "
      "01-JAN-2020 00:00:00\nFileName = " +
      Truth(run, "Scene", "InsFile") + "\n";
  auto section = [](int n, const std::string& from, const std::string& to,
                    const std::string& file) {
    return "[ASA_XCA_" + std::to_string(n) + "]\nStartDate = " + from + "\nStopDate = " + to +
           "\nFileName = " + file + "\n";
  };
  const std::string list = desFolder() + "ASA_AUX_list.dat";
  std::vector<std::string> args = arguments(run, orbitOf(run), folder("aux_bounds") + "R");
  args[kIns] = kNotOK;

  // A section ending at the sensing start is passed over (its file does not
  // exist, so choosing it would fail); the next, starting there, is chosen.
  WriteFile(list, section(0, "01-JAN-2000 00:00:00", start, "no_such_file") +
                      section(1, start, "01-JAN-2020 00:00:00", xca) + ins);
  ExpectSuccess(runTool(args), args);

  // The running numbers end at the first gap: ASA_XCA_2 is never read.
  args[kRoot] = folder("aux_gap") + "R";
  WriteFile(list, section(0, "01-JAN-2000 00:00:00", "01-JAN-2001 00:00:00", xca) +
                      section(2, "01-JAN-2000 00:00:00", "01-JAN-2020 00:00:00", xca) + ins);
  ExpectFailure(runTool(args), 10, "", "file : find_aux", args[kRoot]);
  useAuxiliaryListOf(run);
}

TEST_F(Import, EveryFailureEndsWithItsCodeInTheRecords) {
  const SynthRun& run = *descending_;
  useAuxiliaryListOf(run);
  const std::string dir = folder("failures");
  const std::vector<std::string> good = arguments(run, orbitOf(run), dir + "R");
  const std::vector<uint8_t> product = synth_test::read_file(run.product);
  auto productFile = [&](const std::string& name, const std::vector<uint8_t>& bytes) {
    const std::string path = dir + name;
    WriteFile(path, std::string(bytes.begin(), bytes.end()));
    return path;
  };

  {
    SCOPED_TRACE("13 arguments");
    std::vector<std::string> a = good;
    a.pop_back();
    const Outcome o = runTool(a);
    ExpectFailure(o, 456962, inst_->working() + "args.txt\n", " Parameter 12 (NotOK)\n", a[kRoot]);
  }
  {
    SCOPED_TRACE("no product");
    std::vector<std::string> a = good;
    a[kProduct] = kNotOK;
    ExpectFailure(runTool(a), 456962, "ASA_XXX\n", "\nINPUT ASA : [ NotOK ]", a[kRoot]);
  }
  {
    SCOPED_TRACE("a product that does not open");
    std::vector<std::string> a = good;
    a[kProduct] = dir + "missing.N1";
    ExpectFailure(runTool(a), 9, "", "File not opened!", a[kRoot]);
    a[kXca] = a[kIns] = vlr_test::kSampleXca;  // the same without the list
    ExpectFailure(runTool(a), 9, "", "File not opened!", a[kRoot]);
  }
  {
    SCOPED_TRACE("a product too short for its sensing start");
    std::vector<std::string> a = good;
    a[kProduct] =
        productFile("short.N1", std::vector<uint8_t>(product.begin(), product.begin() + 360));
    ExpectFailure(runTool(a), 4, "", "File reading failed!", a[kRoot]);
  }
  {
    SCOPED_TRACE("no auxiliary list");
    const std::string list = desFolder() + "ASA_AUX_list.dat";
    ASSERT_EQ(std::rename(list.c_str(), (list + ".away").c_str()), 0);
    const Outcome o = runTool(good);
    ASSERT_EQ(std::rename((list + ".away").c_str(), list.c_str()), 0);
    ExpectFailure(o, 9, "", "File not opened!", good[kRoot]);
  }
  {
    SCOPED_TRACE("no auxiliary file valid at the sensing start");
    WriteFile(desFolder() + "ASA_AUX_list.dat",
              "[ASA_XCA_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = 01-JAN-2001 00:00:00\n"
              "FileName = " +
                  Truth(run, "Scene", "XcaFile") + "\n");
    const Outcome o = runTool(good);
    useAuxiliaryListOf(run);
    ExpectFailure(o, 10, "", "file : find_aux", good[kRoot]);
  }
  {
    SCOPED_TRACE("the extraction: a product cut inside its third sub-swath");
    const size_t cut = static_cast<size_t>(TruthNumber(run, SubSwath(3), "MdsOffset"));
    std::vector<std::string> a = good;
    a[kProduct] =
        productFile("truncated.N1", std::vector<uint8_t>(product.begin(), product.begin() + cut));
    ExpectFailure(runTool(a), 4, "", "file : images_v2", a[kRoot]);
  }
  {
    SCOPED_TRACE("the conversion: a polarisation it does not know");
    std::vector<std::string> a = good;
    a[kProduct] = dir + "polarisation.N1";
    WriteWithUnknownPolarisation(run.product, a[kProduct]);
    ExpectFailure(runTool(a), 1, "", "Wrong Polarization Type", a[kRoot]);
  }
}

TEST_F(Import, ASecondImportOverTheSameRootReplacesEverything) {
  const SynthRun& first = *descending_;
  const SynthRun second = synth_test::run_synth("--size small --seed 4");
  const std::unique_ptr<const SynthRun, void (*)(const SynthRun*)> removed(
      &second, [](const SynthRun* r) { synth_test::remove_run(*r); });
  ASSERT_EQ(second.exit_code, 0);
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
    const std::string r = "R" + std::to_string(k);
    for (const char* suffix : {".hdr", "_pattern", "_slc", "_slc.sml", "_slc.vrt"})
      expected.insert(r + suffix);
  }
  std::set<std::string> present;
  for (const auto& e : std::filesystem::directory_iterator(dir))
    present.insert(e.path().filename().string());
  EXPECT_EQ(present, expected);

  // An import over the same root that fails takes the list file with it, so
  // the host never reads a list naming rasters of two different products.
  std::vector<std::string> failing = args;
  failing[kProduct] = scratch_ + "twice_bad.N1";
  WriteWithUnknownPolarisation(second.product, failing[kProduct]);
  ExpectFailure(runTool(failing), 1, "", "Wrong Polarization Type", root, false);
}

TEST_F(Import, AnOutputFolderThatCannotBeWrittenFailsWithoutAList) {
  useAuxiliaryListOf(*descending_);
  // A folder without write permission, or, where permissions do not bind
  // (root), a "folder" that is a regular file.
  const std::string locked = folder("locked");
  ASSERT_EQ(chmod(locked.c_str(), 0555), 0);
  std::string root = locked + "R";
  if (access(locked.c_str(), W_OK) == 0) {
    WriteFile(scratch_ + "plain_file", "not a folder");
    root = scratch_ + "plain_file/R";
  }
  const Outcome o = runTool(arguments(*descending_, orbitOf(*descending_), root));
  chmod(locked.c_str(), 0755);
  EXPECT_NE(o.status, 0);
  EXPECT_NE(o.error.find("[EC : "), std::string::npos) << o.error;
  EXPECT_EQ(o.log.find("SUCCESSFUL"), std::string::npos) << o.log;
  EXPECT_NE(o.log.find("[ERROR ID : "), std::string::npos) << o.log;
  EXPECT_FALSE(Exists(root));
  EXPECT_TRUE(std::filesystem::is_empty(locked));
}

}  // namespace

namespace {

// Every file of a folder, by name, with its bytes.
std::map<std::string, std::string> FolderFiles(const std::string& dir) {
  std::map<std::string, std::string> files;
  for (const auto& e : std::filesystem::directory_iterator(dir))
    files[e.path().filename().string()] = ReadFile(e.path().string());
  return files;
}

}  // namespace

TEST_F(Import, RunsSideBySideMatchRunsOneAfterAnother) {
  useAuxiliaryListOf(*descending_);
  // Two host runs, each with its own working folder and working file, and
  // two runs of the command line, which keeps its process log as R.log.
  constexpr int kRuns = 4;
  struct Run {
    std::vector<std::string> args;
    bool commandLine;
    std::string work;  // the host run's own working folder
  };
  std::vector<Run> runs;
  for (int i = 0; i < kRuns; ++i) {
    const SynthRun& product = i % 2 == 0 ? *descending_ : *ascending_;
    Run r{i % 2 == 0 ? descendingArgs_ : ascendingArgs_, i >= 2,
          folder("side_work_" + std::to_string(i))};
    r.args[kProduct] = product.product;
    r.args[kRoot] = folder("side_" + std::to_string(i)) + "R";
    if (r.commandLine) {
      r.args[kXca] = product.dir + Truth(product, "Scene", "XcaFile");
      r.args[kIns] = product.dir + Truth(product, "Scene", "InsFile");
    }
    runs.push_back(r);
  }
  // The outcome holds the run's whole process log.
  auto runTool = [&](const Run& r) {
    Outcome o;
    if (r.commandLine) {
      o.status = vlr_test::RunProgram(
                     {vlr_test::ToolPath(), "import", r.args[kProduct], "-o", r.args[kRoot],
                      "--orbit", r.args[kDoris], "--xca", r.args[kXca], "--ins", r.args[kIns]},
                     {{"VELORAN_INIT_DIR", ""}}, true)
                     .status;
      o.log = ReadFile(r.args[kRoot] + ".log");
      return o;
    }
    const std::string working = r.work + "Process.working";
    WriteFile(working, "0\nStarting\n");
    WriteFile(working + "_batch_ok", "");
    std::remove((r.work + "Process.log").c_str());
    const std::string list = r.work + "args.txt";
    std::string content = "ARGUMENTS\n";
    for (const std::string& a : r.args) content += a + "\n";
    WriteFile(list, content);
    o.status = inst_
                   ->run(std::string(kImport) + list,
                         {{"VELORAN_WORKING_DIR", r.work}, {"VELORAN_WORKING_FILE", working}})
                   .status;
    o.log = ReadFile(r.work + "Process.log");
    o.error = ReadFile(working + "_error");
    o.workingFileLeft = Exists(working);
    return o;
  };
  // The outputs, without the command line's log, which holds local times.
  auto outputs = [](const Run& r) {
    auto files = FolderFiles(std::filesystem::path(r.args[kRoot]).parent_path().string());
    files.erase("R.log");
    return files;
  };

  std::vector<std::map<std::string, std::string>> oneAfterAnother;
  for (const Run& r : runs) {
    ExpectSuccess(runTool(r), r.args);
    oneAfterAnother.push_back(outputs(r));
    const std::string dir = std::filesystem::path(r.args[kRoot]).parent_path().string();
    std::filesystem::remove_all(dir);
    std::filesystem::create_directories(dir);
  }

  std::vector<std::future<Outcome>> started;
  for (const Run& r : runs) started.push_back(std::async(std::launch::async, runTool, r));
  for (int i = 0; i < kRuns; ++i) {
    SCOPED_TRACE("run " + std::to_string(i));
    const Outcome o = started[i].get();
    ExpectSuccess(o, runs[i].args);
    // The run's log holds its own run and nothing of the others.
    size_t starts = 0;
    for (size_t at = o.log.find("\nSTART : "); at != std::string::npos;
         at = o.log.find("\nSTART : ", at + 1))
      ++starts;
    EXPECT_EQ(starts, 1u) << o.log;
    for (int j = 0; j < kRuns; ++j) {
      if (j != i) {
        EXPECT_EQ(o.log.find(runs[j].args[kRoot]), std::string::npos) << o.log;
      }
    }
    const auto sideBySide = outputs(runs[i]);
    ASSERT_EQ(sideBySide.size(), oneAfterAnother[i].size());
    for (const auto& [name, bytes] : oneAfterAnother[i]) {
      const auto it = sideBySide.find(name);
      ASSERT_NE(it, sideBySide.end()) << name;
      EXPECT_TRUE(it->second == bytes) << name << " differs from the run one after another";
    }
  }
}
