// Geocoding of a multilook image: the coarse lattice of exact inverse
// solutions, the tiles resampled between its nodes, and the output.
#include "geocode/geocoder.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <cmath>
#include <memory>
#include <mutex>
#include <new>
#include <system_error>
#include <thread>
#include <vector>

#include "geocode/cog_writer.h"
#include "geocode/map_to_radar.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/progress.h"

namespace {

constexpr const char* kModule = "geocode";
// Map pixels of a tile side (also the working file's block); a band is one
// row of tiles.
constexpr int kTile = 256;
static_assert(kTile % kLookupStep == 0, "bands start on lattice rows");
// The most image samples one tile reads at once; a tile whose window would
// be larger is split into quarters.
constexpr int64_t kMaxWindow = int64_t{4} << 20;
constexpr int kThreads = 2;
constexpr const char* kProgressTitle = "GEOCODING";

// The multilook raster: float32 lines, nothing else.
class ImageFile {
 public:
  ~ImageFile() {
    if (fd_ >= 0) close(fd_);
  }
  bool open(const char* name, const MlookRadarGrid& grid) {
    fd_ = ::open(name, O_RDONLY);
    if (fd_ < 0) return false;
    struct stat st {};
    samples_ = grid.samples();
    return fstat(fd_, &st) == 0 &&
           st.st_size == static_cast<off_t>(grid.lines()) * grid.samples() * 4;
  }
  // Lines l0..l1 and columns c0..c1 (inclusive) into out, row by row.
  bool read(int l0, int l1, int c0, int c1, float* out) const {
    const size_t count = static_cast<size_t>(c1 - c0 + 1) * sizeof(float);
    for (int l = l0; l <= l1; ++l) {
      const off_t at = (static_cast<off_t>(l) * samples_ + c0) * 4;
      char* to = reinterpret_cast<char*>(out + static_cast<size_t>(l - l0) * (c1 - c0 + 1));
      size_t done = 0;
      while (done < count) {
        const ssize_t n = pread(fd_, to + done, count - done, at + static_cast<off_t>(done));
        if (n <= 0) {
          if (n < 0 && errno == EINTR) continue;
          return false;
        }
        done += static_cast<size_t>(n);
      }
    }
    return true;
  }

 private:
  int fd_ = -1;
  int samples_ = 0;
};

// Line and column of the image at the lattice nodes of one band: node (i, j)
// is the map pixel centre (rowBase + i) kLookupStep + 0.5, j kLookupStep + 0.5.
struct Lattice {
  int rowBase = 0, rows = 0, columns = 0;
  std::vector<double> line, column;  // NaN where no solution exists
  size_t at(int i, int j) const { return static_cast<size_t>(i) * columns + j; }
};

// One thread's image window, tile and the tile's overview averages.
struct Worker {
  std::vector<float> window;
  std::vector<float> tile;
  OverviewBlock overviews;
  bool failed = false;
};

class Geocoder {
 public:
  Geocoder(const MlookRadarGrid& grid, const ImageFile& image) : grid_(grid), image_(image) {}

  // The orbit's inverse geometry reports through the process-wide call
  // tree, so the nodes are solved on the calling thread only.
  static int solveNodes(MapToRadar& solver, Lattice& lattice) {
    for (int i = 0; i < lattice.rows; ++i)
      for (int j = 0; j < lattice.columns; ++j) {
        double line = NAN, column = NAN;
        const double row = (lattice.rowBase + i) * double{kLookupStep} + 0.5;
        if (!solver.solve(row, j * double{kLookupStep} + 0.5, &line, &column)) line = column = NAN;
        lattice.line[lattice.at(i, j)] = line;
        lattice.column[lattice.at(i, j)] = column;
      }
    return lattice.rows * lattice.columns;
  }

  // Resamples map rows r0..r1 and columns c0..c1 (exclusive ends) into the
  // worker's tile (rows of tileWidth values from (tileRow0, tileColumn0)).
  bool resample(Worker& w, const Lattice& lattice, int r0, int r1, int c0, int c1, int tileRow0,
                int tileColumn0, int tileWidth) {
    // The nodes around the rectangle and the image window they span.
    const int i0 = r0 / kLookupStep - lattice.rowBase;
    const int i1 = (r1 - 1) / kLookupStep + 1 - lattice.rowBase;
    const int j0 = c0 / kLookupStep;
    const int j1 = (c1 - 1) / kLookupStep + 1;
    double lmin = INFINITY, lmax = -INFINITY, cmin = INFINITY, cmax = -INFINITY;
    for (int i = i0; i <= i1; ++i)
      for (int j = j0; j <= j1; ++j) {
        const double l = lattice.line[lattice.at(i, j)], c = lattice.column[lattice.at(i, j)];
        if (std::isnan(l)) continue;
        lmin = std::min(lmin, l);
        lmax = std::max(lmax, l);
        cmin = std::min(cmin, c);
        cmax = std::max(cmax, c);
      }
    const int lastLine = grid_.lines() - 1, lastColumn = grid_.samples() - 1;
    int wl0 = 0, wl1 = -1, wc0 = 0, wc1 = -1;
    if (lmin <= lastLine && lmax >= 0.0 && cmin <= lastColumn && cmax >= 0.0) {
      wl0 = static_cast<int>(std::max(0.0, std::floor(lmin) - 1.0));
      wl1 = static_cast<int>(std::min<double>(lastLine, std::ceil(lmax) + 1.0));
      wc0 = static_cast<int>(std::max(0.0, std::floor(cmin) - 1.0));
      wc1 = static_cast<int>(std::min<double>(lastColumn, std::ceil(cmax) + 1.0));
    }
    auto nodata = [&] {
      // Nothing of the image is near.
      for (int r = r0; r < r1; ++r)
        std::fill_n(&w.tile[static_cast<size_t>(r - tileRow0) * tileWidth + (c0 - tileColumn0)],
                    c1 - c0, kGeocodeNoData);
    };
    if (wl0 > wl1 || wc0 > wc1) {
      nodata();
      return true;
    }
    const int64_t size = int64_t{wl1 - wl0 + 1} * (wc1 - wc0 + 1);
    if (size > kMaxWindow && (r1 - r0 > kLookupStep || c1 - c0 > kLookupStep)) {
      const int rm = r1 - r0 > kLookupStep ? r0 + (r1 - r0) / 2 / kLookupStep * kLookupStep : r1;
      const int cm = c1 - c0 > kLookupStep ? c0 + (c1 - c0) / 2 / kLookupStep * kLookupStep : c1;
      const int rows[3] = {r0, rm, r1}, cols[3] = {c0, cm, c1};
      for (int a = 0; a < 2; ++a)
        for (int b = 0; b < 2; ++b)
          if (rows[a] < rows[a + 1] && cols[b] < cols[b + 1] &&
              !resample(w, lattice, rows[a], rows[a + 1], cols[b], cols[b + 1], tileRow0,
                        tileColumn0, tileWidth))
            return false;
      return true;
    }
    try {
      w.window.resize(static_cast<size_t>(size));
    } catch (const std::bad_alloc&) {
      return false;
    }
    if (!image_.read(wl0, wl1, wc0, wc1, w.window.data())) return false;
    const int ww = wc1 - wc0 + 1;
    for (int r = r0; r < r1; ++r) {
      // Position of the pixel centre between the node rows.
      const double fr = (r + 0.0) / kLookupStep - lattice.rowBase;
      const int i = std::min(static_cast<int>(fr), lattice.rows - 2);
      const double u = fr - i;
      float* out = &w.tile[static_cast<size_t>(r - tileRow0) * tileWidth] - tileColumn0;
      // One run of columns per lattice cell: its four nodes are read once.
      for (int c = c0; c < c1;) {
        const int j = std::min(c / kLookupStep, lattice.columns - 2);
        const int end = j == lattice.columns - 2 ? c1 : std::min(c1, (j + 1) * kLookupStep);
        const size_t a = lattice.at(i, j), d = lattice.at(i + 1, j);
        const double la = lattice.line[a], lb = lattice.line[a + 1], ld = lattice.line[d],
                     le = lattice.line[d + 1];
        const double ca = lattice.column[a], cb = lattice.column[a + 1], cd = lattice.column[d],
                     ce = lattice.column[d + 1];
        if (std::isnan(la + lb + ld + le)) {
          // A node the orbit does not see lies far beyond the image in
          // azimuth (the orbit reaches a fifth of the scene, and at least
          // ten seconds, past either end): so does its cell.
          std::fill(out + c, out + end, kGeocodeNoData);
          c = end;
          continue;
        }
        for (; c < end; ++c) {
          const double v = (c + 0.0) / kLookupStep - j;
          const double line = (1 - u) * ((1 - v) * la + v * lb) + u * ((1 - v) * ld + v * le);
          const double column = (1 - u) * ((1 - v) * ca + v * cb) + u * ((1 - v) * cd + v * ce);
          out[c] = sample(w.window.data(), wl0, wl1, wc0, wc1, ww, line, column);
        }
      }
    }
    return true;
  }

 private:
  bool inside(double line, double column) const {
    return line >= 0.0 && line <= grid_.lines() - 1.0 && column >= 0.0 &&
           column <= grid_.samples() - 1.0;
  }
  // Bilinear amplitude at (line, column) from the window of lines l0..l1 and
  // columns c0..c1 (ww per row); no data outside the image.
  float sample(const float* window, int l0, int l1, int c0, int c1, int ww, double line,
               double column) const {
    if (!inside(line, column)) return kGeocodeNoData;
    const int l = std::min(std::max(static_cast<int>(line), l0), std::max(l0, l1 - 1));
    const int k = std::min(std::max(static_cast<int>(column), c0), std::max(c0, c1 - 1));
    const int ln = std::min(l + 1, l1), kn = std::min(k + 1, c1);
    const double u = std::min(1.0, std::max(0.0, line - l));
    const double v = std::min(1.0, std::max(0.0, column - k));
    const float* p = window + static_cast<size_t>(l - l0) * ww;
    const float* q = window + static_cast<size_t>(ln - l0) * ww;
    const double value = (1 - u) * ((1 - v) * p[k - c0] + v * p[kn - c0]) +
                         u * ((1 - v) * q[k - c0] + v * q[kn - c0]);
    return std::isfinite(value) ? static_cast<float>(value) : kGeocodeNoData;
  }

  const MlookRadarGrid& grid_;
  const ImageFile& image_;
};

// Runs f(0) on a second thread and f(1) here; without a thread, both here.
template <class F>
void OnTwoThreads(F&& f) {
  std::thread other;
  try {
    other = std::thread([&] { f(0); });
  } catch (const std::system_error&) {
    f(0);
    f(1);
    return;
  }
  f(1);
  other.join();
}

}  // namespace

int GeocodeImage(const char* image, const MlookRadarGrid& grid, const GeneralSAROrbit& orbit,
                 const MapGrid& map, const char* output, std::string* message,
                 GeocodeFigures* figures) {
  VLR_SCOPE("GeocodeImage", kModule);
  if (!grid.valid() || map.width < 1 || map.height < 1 || !(map.spacing > 0.0)) {
    *message = "Nothing to geocode";
    VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
  }
  ImageFile file;
  if (!file.open(image, grid)) {
    *message = std::string("Cannot read the image ") + image + " with the size of its grid";
    VLR_FAIL(message->c_str(), vlr::kLibRead);
  }
  MapToRadar solver(grid, map);
  if (solver.open(orbit, message) != 0) VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
  std::unique_ptr<Worker> workers[kThreads];
  try {
    for (auto& w : workers) {
      w.reset(new Worker);
      w->tile.assign(static_cast<size_t>(kTile) * kTile, kGeocodeNoData);
    }
  } catch (const std::bad_alloc&) {
    *message = "Cannot allocate the map tiles";
    VLR_FAIL(message->c_str(), vlr::kLibAlloc);
  }
  CogWriter writer;
  if (!writer.create(output, map, kGeocodeNoData, kTile, message))
    VLR_FAIL(message->c_str(), vlr::kLibWrite);

  Geocoder geocoder(grid, file);
  // Two lattices: the calling thread solves the next band's nodes while the
  // other thread resamples the tiles of the current band.
  Lattice lattices[2];
  int exact = 0;
  auto solveBand = [&](Lattice& lattice, int band) {
    const int bandEnd = std::min(map.height, band + kTile);
    lattice.columns = (map.width - 1) / kLookupStep + 2;
    lattice.rowBase = band / kLookupStep;
    lattice.rows = (bandEnd - 1) / kLookupStep + 2 - lattice.rowBase;
    lattice.line.assign(static_cast<size_t>(lattice.rows) * lattice.columns, NAN);
    lattice.column.assign(lattice.line.size(), NAN);
    exact += Geocoder::solveNodes(solver, lattice);
  };
  std::mutex writing;
  bool readFailed = false, writeFailed = false;
  int valid = 0, percent = -1;
  solveBand(lattices[0], 0);
  for (int band = 0, current = 0; band < map.height; band += kTile, current ^= 1) {
    // Progress for the host, which may also withdraw the run here.
    const int now = static_cast<int>(int64_t{100} * band / map.height);
    getAndSetPerc(percent, now, kProgressTitle);
    percent = now;
    const int bandEnd = std::min(map.height, band + kTile);
    const Lattice& lattice = lattices[current];
    std::atomic<int> next{0};
    const int tiles = (map.width + kTile - 1) / kTile;
    OnTwoThreads([&](int t) {
      // t == 1 runs on the calling thread, the only one the orbit may use.
      if (t == 1 && bandEnd < map.height) solveBand(lattices[current ^ 1], bandEnd);
      Worker& w = *workers[t];
      for (int k = next++; k < tiles; k = next++) {
        const int c0 = k * kTile, c1 = std::min(map.width, c0 + kTile);
        // The tile's rows one after another, as GDAL wants them.
        if (!geocoder.resample(w, lattice, band, bandEnd, c0, c1, band, c0, c1 - c0)) {
          w.failed = true;
          return;
        }
        const size_t size = static_cast<size_t>(bandEnd - band) * (c1 - c0);
        const int count = static_cast<int>(
            size - std::count(w.tile.begin(), w.tile.begin() + size, kGeocodeNoData));
        writer.reduce(c1 - c0, bandEnd - band, w.tile.data(), &w.overviews);
        std::lock_guard<std::mutex> lock(writing);
        valid += count;
        if (!writer.write(c0, band, c1 - c0, bandEnd - band, w.tile.data(), w.overviews)) {
          writeFailed = true;
          return;
        }
      }
    });
    readFailed = workers[0]->failed || workers[1]->failed;
    if (readFailed || writeFailed) break;
  }
  if (readFailed) {
    *message = std::string("Cannot read the image ") + image;
    VLR_FAIL(message->c_str(), vlr::kLibRead);
  }
  if (writeFailed) {
    *message = std::string("Cannot write the map image ") + output;
    VLR_FAIL(message->c_str(), vlr::kLibWrite);
  }
  const auto cogStart = std::chrono::steady_clock::now();
  const bool written = writer.finish(message);
  const std::chrono::duration<double> cogTime = std::chrono::steady_clock::now() - cogStart;
  // GDAL leaves errno set by the files it probed.
  errno = 0;
  if (!written) VLR_FAIL(message->c_str(), vlr::kLibWrite);
  if (figures != nullptr) {
    figures->exactSolutions = exact;
    figures->validPixels = valid;
    figures->cogSeconds = cogTime.count();
  }
  return 0;
}
