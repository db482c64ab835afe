#include "synth_run.h"

#include <sys/wait.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace synth_test {

int shell(const std::string& command) {
  const int st = std::system(command.c_str());
  if (st == -1 || !WIFEXITED(st)) return -1;
  return WEXITSTATUS(st);
}

SynthRun run_synth(const std::string& args) {
  SynthRun r;
  std::string tmpl = (std::filesystem::temp_directory_path() / "synthXXXXXX").string();
  if (mkdtemp(&tmpl[0]) == nullptr) return r;
  r.dir = tmpl + "/";
  r.exit_code = shell(std::string(ENVISAT_SYNTH) + " --out " + r.dir + " " + args + " > " + r.dir +
                      "synth.log 2>&1");
  if (r.exit_code == 0) {
    r.truth = read_params(r.dir + "synth_truth.txt");
    r.product = r.dir + r.truth["Scene"]["Product"];
  }
  return r;
}

void remove_run(const SynthRun& run) {
  std::error_code ec;
  if (!run.dir.empty()) std::filesystem::remove_all(run.dir, ec);
}

Params read_params(const std::string& path) {
  Params p;
  std::ifstream f(path);
  std::string line, section;
  auto trim = [](std::string s) {
    const size_t a = s.find_first_not_of(' ');
    const size_t b = s.find_last_not_of(' ');
    return a == std::string::npos ? std::string() : s.substr(a, b - a + 1);
  };
  while (std::getline(f, line)) {
    if (!line.empty() && line[0] == '[') {
      section = line.substr(1, line.find(']') - 1);
      continue;
    }
    const size_t eq = line.find('=');
    if (section.empty() || eq == std::string::npos) continue;
    p[section][trim(line.substr(0, eq))] = trim(line.substr(eq + 1));
  }
  return p;
}

std::vector<uint8_t> read_file(const std::string& path) {
  std::ifstream f(path, std::ios::binary);
  return std::vector<uint8_t>(std::istreambuf_iterator<char>(f), std::istreambuf_iterator<char>());
}

std::string read_text(const std::string& path) {
  std::ifstream f(path);
  std::stringstream s;
  s << f.rdbuf();
  return s.str();
}

uint32_t be32(const uint8_t* p) {
  return (uint32_t(p[0]) << 24) | (uint32_t(p[1]) << 16) | (uint32_t(p[2]) << 8) | p[3];
}
int16_t be16(const uint8_t* p) {
  return static_cast<int16_t>((p[0] << 8) | p[1]);
}

float bef32(const uint8_t* p) {
  const uint32_t u = be32(p);
  float f;
  std::memcpy(&f, &u, 4);
  return f;
}

double mjd_time(const uint8_t* p) {
  constexpr double kMjd2000In1985 = 473299200.0;
  return static_cast<int32_t>(be32(p)) * 86400.0 + be32(p + 4) + be32(p + 8) * 1e-6 +
         kMjd2000In1985;
}

Dsd product_dsd(const std::vector<uint8_t>& f, int k) {
  // DSDs follow the 1247-byte MPH and the 1059 bytes of the SPH proper.
  constexpr size_t kFirstDsd = 1247 + 1059, kDsdSize = 280;
  constexpr size_t kOffset = 133, kSize = 170, kNum = 207, kDsrSize = 228;
  const size_t b = kFirstDsd + kDsdSize * k;
  return {header_number(f, b + kOffset), header_number(f, b + kSize), header_number(f, b + kNum),
          header_number(f, b + kDsrSize)};
}

double truth_number(const Params& truth, const std::string& section, const std::string& key) {
  const auto s = truth.find(section);
  if (s == truth.end()) return std::nan("");
  const auto v = s->second.find(key);
  return v == s->second.end() ? std::nan("") : std::atof(v->second.c_str());
}

long long header_number(const std::vector<uint8_t>& file, size_t offset) {
  if (offset + 22 > file.size()) return -1;
  const std::string s(reinterpret_cast<const char*>(&file[offset]), 22);
  return std::atoll(s.c_str());
}

}  // namespace synth_test
