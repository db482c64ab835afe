// Orbit test material: the real DORIS files, DORIS files built from their
// header with chosen records, and a closed-form circular orbit.
#pragma once

#include <gtest/gtest.h>

#include <cctype>
#include <cmath>
#include <cstdio>
#include <ctime>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "metadata_fixture.h"
#include "sample_files.h"
#include "truth_math.h"

namespace orbit_test {

const std::string kVor = vlr_test::kSampleVor;
const std::string kPor = vlr_test::kSamplePor;
const std::string kXca = vlr_test::kSampleXca;

constexpr size_t kHeaderSize = 1625;
constexpr size_t kRecordSize = 129;

inline std::string Slurp(const std::string& file) {
  std::ifstream in(file, std::ios::binary);
  std::ostringstream s;
  s << in.rdbuf();
  return s.str();
}

// One record as the test reads it, with the standard library only.
struct Record {
  double t = 0.0;
  int orbit = 0;
  double p[3] = {0, 0, 0};
  double v[3] = {0, 0, 0};
};

inline Record ParseRecord(const std::string& r) {
  Record x;
  x.t = truth::Sec85(r.substr(0, 27));
  x.orbit = std::stoi(r.substr(37, 6));
  for (int a = 0; a < 3; ++a) {
    x.p[a] = std::stod(r.substr(44 + 13 * a, 12));
    x.v[a] = std::stod(r.substr(83 + 13 * a, 12));
  }
  return x;
}

// The header and the record texts of a DORIS file.
struct DorisText {
  std::string header;
  std::vector<std::string> records;
};

inline DorisText SplitDoris(const std::string& file) {
  const std::string all = Slurp(file);
  DorisText d;
  d.header = all.substr(0, kHeaderSize);
  for (size_t at = kHeaderSize; at + kRecordSize <= all.size(); at += kRecordSize)
    d.records.push_back(all.substr(at, kRecordSize));
  return d;
}

// Replaces the value of a header line "KEY=" by `value` (same width).
inline void SetHeaderValue(std::string* header, const std::string& key, const std::string& value) {
  const size_t at = header->find("\n" + key + "=");
  ASSERT_NE(at, std::string::npos) << key;
  header->replace(at + 2 + key.size(), value.size(), value);
}

inline std::string CountText(long long n) {
  char b[32];
  std::snprintf(b, sizeof b, "%+011lld", n);
  return b;
}

// "DD-MMM-YYYY HH:MM:SS.ffffff" of seconds since 1985, by the C library.
inline std::string DateText(double t) {
  constexpr time_t kUnixAt1985 = 473385600;
  const double whole = std::floor(t);
  const time_t unix = kUnixAt1985 + static_cast<time_t>(whole);
  char text[40];
  std::strftime(text, sizeof text, "%d-%b-%Y %H:%M:%S", std::gmtime(&unix));
  for (char* c = text + 3; c < text + 6; ++c) *c = static_cast<char>(std::toupper(*c));
  std::snprintf(text + 20, sizeof text - 20, ".%06d",
                static_cast<int>(std::lround((t - whole) * 1e6)));
  return text;
}

// A circular orbit of radius r and inclination incl, seen from the rotating
// Earth: ascending node at longitude lon0 at time tNode.
struct CircularOrbit {
  double r = 7159000.0;
  double incl = 98.55 * M_PI / 180.0;
  double tNode = 7.3e8;
  double lon0 = 0.3;
  double mean() const { return std::sqrt(3.986004418e14 / (r * r * r)); }
  // Earth-fixed position and velocity at t.
  void at(double t, double p[3], double v[3]) const {
    const double we = 7.292115189334571e-5;
    const double n = mean();
    const double u = n * (t - tNode);
    const double ci = std::cos(incl), si = std::sin(incl);
    // Inertial, node on the x axis.
    const double x = r * std::cos(u), y = r * std::sin(u) * ci, z = r * std::sin(u) * si;
    const double vx = -r * n * std::sin(u), vy = r * n * std::cos(u) * ci,
                 vz = r * n * std::cos(u) * si;
    // Rotate by the node longitude and the Earth's turn since tNode.
    const double th = lon0 - we * (t - tNode);
    const double c = std::cos(th), s = std::sin(th);
    p[0] = c * x - s * y;
    p[1] = s * x + c * y;
    p[2] = z;
    // d/dt of the rotated vector: rotated velocity plus the frame's turn.
    v[0] = c * vx - s * vy + we * (s * x + c * y);
    v[1] = s * vx + c * vy - we * (c * x - s * y);
    v[2] = vz;
  }
};

// n vectors of the orbit from t0, dt apart, into a section with SVCreate.
template <class Section>
void Sample(const CircularOrbit& orbit, double t0, double dt, int n, Section* s) {
  ASSERT_EQ(s->SVCreate(t0, dt, n), 0);
  for (int i = 0; i < n; ++i)
    orbit.at(t0 + i * dt, s->positions() + 3 * i, s->velocities() + 3 * i);
}

// Largest position and velocity errors (m, m/s) of the section's SVGetPos
// and SVGetVel against the orbit at the given times.
template <class Section>
void WorstErrors(const CircularOrbit& orbit, Section* s, const std::vector<double>& times,
                 double* worstP, double* worstV) {
  *worstP = *worstV = 0.0;
  for (double t : times) {
    double p[3], v[3], rp[3], rv[3];
    ASSERT_EQ(s->SVGetPos(t, p), 0) << t;
    ASSERT_EQ(s->SVGetVel(t, v), 0) << t;
    orbit.at(t, rp, rv);
    for (int a = 0; a < 3; ++a) {
      *worstP = std::fmax(*worstP, std::fabs(p[a] - rp[a]));
      *worstV = std::fmax(*worstV, std::fabs(v[a] - rv[a]));
    }
  }
}

// A scratch directory per test, with DORIS files written into it.
class ScratchTest : public MetadataTest {
 protected:
  // Writes header and records; the record count written is `count`, or the
  // number of records when count < 0, and the data set size agrees with it.
  std::string WriteDoris(const std::string& name, std::string header,
                         const std::vector<std::string>& records, long long count = -1) {
    const long long n = count < 0 ? (long long)records.size() : count;
    SetHeaderValue(&header, "NUM_DSR", CountText(n));
    char size[32];
    std::snprintf(size, sizeof size, "%+021lld", n * (long long)kRecordSize);
    SetHeaderValue(&header, "DS_SIZE", size);
    std::string text = header;
    for (const std::string& r : records) text += r;
    spit(path(name), text);
    return path(name);
  }
};

}  // namespace orbit_test
