#include "cli/run_summary.h"

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <map>

namespace vlr::cli {

namespace {

namespace fs = std::filesystem;

std::string nodeText(xmlNode* n) {
  xmlChar* c = xmlNodeGetContent(n);
  std::string s = c ? reinterpret_cast<const char*>(c) : "";
  xmlFree(c);
  const size_t b = s.find_first_not_of(" \t\r\n");
  const size_t e = s.find_last_not_of(" \t\r\n");
  return b == std::string::npos ? "" : s.substr(b, e - b + 1);
}

bool named(xmlNode* n, const char* name) {
  return n->type == XML_ELEMENT_NODE &&
         std::strcmp(reinterpret_cast<const char*>(n->name), name) == 0;
}

// The first text of every element name, and the OtherInfo rows (a key cell
// and a value cell of StringValue elements).
void collect(xmlNode* n, std::map<std::string, std::string>& fields,
             std::map<std::string, std::string>& other) {
  for (; n != nullptr; n = n->next) {
    if (n->type != XML_ELEMENT_NODE) continue;
    if (named(n, "MatrixRow")) {
      std::vector<std::string> cells;
      for (xmlNode* c = n->children; c != nullptr; c = c->next) {
        if (named(c, "StringValue")) cells.push_back(nodeText(c));
      }
      if (cells.size() >= 2) other.emplace(cells[0], cells[1]);
      continue;
    }
    const std::string name = reinterpret_cast<const char*>(n->name);
    if (fields.find(name) == fields.end() && n->children != nullptr &&
        n->children->type == XML_TEXT_NODE && n->children->next == nullptr)
      fields[name] = nodeText(n);
    collect(n->children, fields, other);
  }
}

bool number(const std::map<std::string, std::string>& m, const std::string& key, double& v) {
  const auto it = m.find(key);
  if (it == m.end() || it->second.empty()) return false;
  char* end = nullptr;
  v = std::strtod(it->second.c_str(), &end);
  return end != it->second.c_str();
}

}  // namespace

bool ReadImageFacts(const std::string& sml, ImageFacts& facts) {
  xmlDoc* doc =
      xmlReadFile(sml.c_str(), nullptr,
                  XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING | XML_PARSE_NOBLANKS);
  if (doc == nullptr) return false;
  std::map<std::string, std::string> fields, other;
  collect(xmlDocGetRootElement(doc), fields, other);
  xmlFreeDoc(doc);
  facts = ImageFacts{};
  double v = 0;
  if (number(fields, "NrOfLinesPerImage", v)) facts.lines = static_cast<long>(v);
  if (number(fields, "NrOfPixelsPerLine", v)) facts.samples = static_cast<long>(v);
  // Corner points 3, 4, 2, 1 are the NW, NE, SW and SE corners.
  for (const char* k : {"3", "4", "2", "1"}) {
    double lon = 0, lat = 0;
    if (!number(other, std::string("CORNER POINT ") + k + "  X", lon) ||
        !number(other, std::string("CORNER POINT ") + k + "  Y", lat)) {
      facts.corners.clear();
      break;
    }
    facts.corners.emplace_back(lat, lon);
  }
  return true;
}

std::vector<std::string> WrittenFiles(const std::string& root, std::time_t since) {
  std::vector<std::string> files;
  const fs::path r(root);
  const std::string prefix = r.filename().string();
  std::error_code ec;
  const fs::path dir = r.has_parent_path() ? r.parent_path() : fs::path(".");
  for (const fs::directory_entry& e : fs::directory_iterator(dir, ec)) {
    const std::string name = e.path().filename().string();
    struct stat st {};
    if (name.compare(0, prefix.size(), prefix) != 0 || stat(e.path().c_str(), &st) != 0 ||
        !S_ISREG(st.st_mode) || st.st_mtime < since)
      continue;
    files.push_back(e.path().string());
  }
  std::sort(files.begin(), files.end());
  return files;
}

std::string HumanSize(unsigned long long bytes) {
  static const char* kUnits[] = {"B", "KB", "MB", "GB", "TB"};
  double v = static_cast<double>(bytes);
  int u = 0;
  while (v >= 1024.0 && u < 4) {
    v /= 1024.0;
    ++u;
  }
  char text[32];
  if (u == 0) {
    std::snprintf(text, sizeof text, "%llu B", bytes);
  } else {
    std::snprintf(text, sizeof text, "%.1f %s", v, kUnits[u]);
  }
  return text;
}

std::string Summary(const std::vector<std::string>& files) {
  if (files.empty()) return "";
  std::string text = "Written in " + fs::path(files.front()).parent_path().string() + ":\n";
  char line[1024];
  for (const std::string& f : files) {
    struct stat st {};
    stat(f.c_str(), &st);
    std::snprintf(line, sizeof line, "  %-40s %10s\n", fs::path(f).filename().c_str(),
                  HumanSize(static_cast<unsigned long long>(st.st_size)).c_str());
    text += line;
  }
  for (const std::string& f : files) {
    if (f.size() < 4 || f.compare(f.size() - 4, 4, ".sml") != 0) continue;
    ImageFacts facts;
    if (!ReadImageFacts(f, facts)) continue;
    const std::string image = fs::path(f.substr(0, f.size() - 4)).filename().string();
    std::snprintf(line, sizeof line, "%s: %ld lines x %ld samples\n", image.c_str(), facts.lines,
                  facts.samples);
    text += line;
    if (facts.corners.empty()) {
      text += "  no corners (imported without orbit)\n";
      continue;
    }
    static const char* kPoints[] = {"NW", "NE", "SW", "SE"};
    text += "  corners (lat, lon):";
    for (size_t i = 0; i < facts.corners.size(); ++i) {
      std::snprintf(line, sizeof line, " %s (%.4f, %.4f)", kPoints[i], facts.corners[i].first,
                    facts.corners[i].second);
      text += line;
    }
    text += "\n";
  }
  return text;
}

}  // namespace vlr::cli
