// Writing suite headers: the ".sml" XML form and the header written beside
// every product (derived map grid, "SOFTWARE" entry, ENVI header).
//
// The file is written to a temporary file beside the target and renamed over
// it only when complete, so a failed write never leaves half a header.  Text
// is Latin-1: bytes 128-255 are written as they are.  Doubles are written
// with the fewest digits that read back bit for bit.
#include <expat.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_handle.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"
#include "suite/description_header.h"
#include "suite/description_io.h"
#include "suite/envi_header.h"
#include "suite/number_text.h"

using namespace vlr_header_io;

namespace {

constexpr const char* kXsiNamespace = "http://www.w3.org/2001/XMLSchema-instance";
constexpr const char* kIndent = "   ";
constexpr size_t kCopyChunkBytes = 1u << 16;
constexpr const char* kSoftwareKey = "SOFTWARE";

// A failure while writing; turned into 261124 once the temporary file is gone.
struct WriteFailure {
  std::string what;
  std::string reason;
};

// An element name that an XML parser accepts (ASCII letters, digits, '_',
// '-', '.', ':' and Latin-1 letters; not starting with a digit, '-' or '.').
bool isXmlName(const std::string& name) {
  if (name.empty()) return false;
  for (size_t i = 0; i < name.size(); ++i) {
    const unsigned char c = static_cast<unsigned char>(name[i]);
    const bool letter =
        std::isalpha(c) || c == '_' || c == ':' || (c >= 0xC0 && c != 0xD7 && c != 0xF7);
    const bool other = std::isdigit(c) || c == '-' || c == '.' || c == 0xB7;
    if (!letter && !(i > 0 && other)) return false;
  }
  return true;
}

// The value text of a string: entities for the markup characters, character
// references for tab, LF and CR; "" for the empty string.  Other control
// bytes cannot be held by an XML file.
std::string escaped(const std::string& value, const std::string& what) {
  if (value.empty()) return "\"\"";
  std::string out;
  out.reserve(value.size() + value.size() / 8);
  for (const char ch : value) {
    const unsigned char c = static_cast<unsigned char>(ch);
    if (const char* entity = XmlEntity(ch)) {
      out += entity;
      continue;
    }
    switch (c) {
      case '\t':
        out += "&#9;";
        break;
      case '\n':
        out += "&#10;";
        break;
      case '\r':
        out += "&#13;";
        break;
      default:
        if (c < 0x20) {
          throw WriteFailure{
              what, "control character " + std::to_string(c) + " cannot be written to an XML file"};
        }
        out.push_back(ch);
    }
  }
  return out;
}

std::string elementText(const CDescriptionField& field, int row, int column,
                        const std::string& what) {
  if (row >= field.rows() || column >= field.columns() || !field.isSetAt(row, column)) return "";
  switch (field.type()) {
    case CVLR_FieldType::Integer:
      return std::to_string(field.getIntegerAt(row, column));
    case CVLR_FieldType::Double:
      return NVLR_UTILITY_DoubleText(field.getDoubleAt(row, column));
    case CVLR_FieldType::String:
      return escaped(field.getStringAt(row, column), what);
    case CVLR_FieldType::FieldOfSection:
      break;
  }
  return "";
}

// A section of the previous file, by byte range of its element.
struct PreviousSection {
  std::string name;
  long long begin = 0;
  long long end = 0;
};

struct ScanState {
  XML_Parser parser = nullptr;
  int depth = 0;
  std::vector<PreviousSection> sections;
};

void XMLCALL scanStart(void* data, const XML_Char* name, const XML_Char**) {
  auto& s = *static_cast<ScanState*>(data);
  if (++s.depth != 2) return;
  PreviousSection section;
  if (!AppendLatin1(section.name, name, std::strlen(name))) section.name = name;
  section.begin = static_cast<long long>(XML_GetCurrentByteIndex(s.parser));
  s.sections.push_back(std::move(section));
}

void XMLCALL scanEnd(void* data, const XML_Char*) {
  auto& s = *static_cast<ScanState*>(data);
  if (s.depth-- != 2 || s.sections.empty()) return;
  s.sections.back().end =
      static_cast<long long>(XML_GetCurrentByteIndex(s.parser)) + XML_GetCurrentByteCount(s.parser);
}

struct ParserFree {
  void operator()(XML_Parser p) const { XML_ParserFree(p); }
};

// The sections of the file at path (the children of its root element).  A
// previous file that does not parse holds nothing to carry over.
std::vector<PreviousSection> previousSections(const std::string& path) {
  const FileHandle file(path.c_str(), "rb");
  if (!file) return {};
  std::unique_ptr<XML_ParserStruct, ParserFree> parser(XML_ParserCreate("ISO-8859-1"));
  if (!parser) return {};
  ScanState state;
  state.parser = parser.get();
  XML_SetUserData(parser.get(), &state);
  XML_SetElementHandler(parser.get(), scanStart, scanEnd);
  std::vector<char> buffer(kCopyChunkBytes);
  bool done = false;
  while (!done) {
    const size_t got = std::fread(buffer.data(), 1, buffer.size(), file.get());
    done = got < buffer.size();
    if (std::ferror(file.get()) || XML_Parse(parser.get(), buffer.data(), static_cast<int>(got),
                                             done ? 1 : 0) != XML_STATUS_OK) {
      NVLR_UTILITY_TracePrint("Previous header not readable, no section carried over : %s\n",
                              path.c_str());
      return {};
    }
  }
  return state.sections;
}

// The temporary file beside the target; removed unless renamed over it.
class TemporaryFile {
 public:
  explicit TemporaryFile(const std::string& target) : mTarget(target) {
    if (target.empty()) throw WriteFailure{std::string(), "no file name"};
    std::vector<char> name(target.begin(), target.end());
    const char suffix[] = ".tmpXXXXXX";
    name.insert(name.end(), suffix, suffix + sizeof suffix);
    const int fd = mkstemp(name.data());
    if (fd < 0) throw WriteFailure{std::string(), std::strerror(errno)};
    mPath = name.data();
    VlrRunOutputBegun(mPath.c_str());
    fchmod(fd, targetMode());
    mFile = FileHandle(fdopen(fd, "wb"));
    if (!mFile.valid()) {
      close(fd);
      discard();
      throw WriteFailure{std::string(), "temporary file cannot be opened"};
    }
  }
  ~TemporaryFile() { discard(); }
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;

  FILE* file() const { return mFile.get(); }

  void commit() {
    const bool written = std::fflush(mFile.get()) == 0 && !std::ferror(mFile.get());
    const bool closed = mFile.close();
    if (!written || !closed) throw WriteFailure{std::string(), "write failure"};
    if (std::rename(mPath.c_str(), mTarget.c_str()) != 0)
      throw WriteFailure{std::string(), std::strerror(errno)};
    VlrRunOutputMoved(mPath.c_str(), mTarget.c_str());
    mPath.clear();
  }

  void discard() {
    mFile.reset();
    if (!mPath.empty()) std::remove(mPath.c_str());
    if (!mPath.empty()) VlrRunOutputRemoved(mPath.c_str());
    mPath.clear();
  }

 private:
  // The mode of the file it replaces, else what the process would create.
  mode_t targetMode() const {
    struct stat st;
    if (stat(mTarget.c_str(), &st) == 0) return st.st_mode & 07777;
    const mode_t mask = umask(0);
    umask(mask);
    return 0666 & ~mask;
  }

  std::string mTarget;
  std::string mPath;
  FileHandle mFile;
};

class XmlHeaderWriter {
 public:
  XmlHeaderWriter(FILE* file, const std::string& previousPath)
      : mFile(file), mPreviousPath(previousPath) {}

  void write(const CDescriptionHeader& header, const std::vector<PreviousSection>& carried) {
    if (!isXmlName(header.mInitialTag))
      throw WriteFailure{header.mInitialTag, "not an XML element name"};
    put("<?xml version=\"1.0\" ?>\n");
    put("<" + header.mInitialTag);
    if (header.mInitialTag.find(CVLR_HEADER_INFO) != std::string::npos) {
      const std::string ns = CVLR_HEADER_NAMESPACE;
      put(" xmlns=\"" + ns + "\"\n\txmlns:xsi=\"" + kXsiNamespace + "\"\n\txsi:schemaLocation=\"" +
          ns + "\n\t" + ns + "/" + CVLR_HEADER_SCHEMA_FILE + "\"");
    }
    put(">\n");
    for (int i = 0; i < header.sectionCount(); ++i) writeSection(header.section(i));
    for (const auto& section : carried) copyPrevious(section);
    put("</" + header.mInitialTag + ">\n");
  }

 private:
  void put(const std::string& text) {
    if (std::fwrite(text.data(), 1, text.size(), mFile) != text.size())
      throw WriteFailure{std::string(), "write failure"};
  }

  void line(int level, const std::string& text) {
    for (int i = 0; i < level; ++i) put(kIndent);
    put(text);
    put("\n");
  }

  static std::string open(const std::string& name) { return "<" + name + ">"; }
  static std::string close(const std::string& name) { return "</" + name + ">"; }
  static std::string attribute(const char* name, int value) {
    return std::string(" ") + name + " = \"" + std::to_string(value) + "\"";
  }

  void requireName(const std::string& name, const std::string& what) const {
    if (!isXmlName(name)) throw WriteFailure{what, "not an XML element name"};
  }

  void writeSection(const CDescriptionSection& section) {
    if (!section.isSet()) {
      NVLR_UTILITY_TracePrint("%s IS_EMPTY\n", section.name().c_str());
      return;
    }
    requireName(section.name(), section.name());
    line(1, open(section.name()));
    for (int i = 0; i < section.fieldCount(); ++i) {
      const CDescriptionField& field = section.field(i);
      const std::string what = section.name() + "." + field.name();
      requireName(field.name(), what);
      switch (field.shape()) {
        case CVLR_FieldShape::Scalar:
          line(2, open(field.name()) + elementText(field, 0, 0, what) + close(field.name()));
          break;
        case CVLR_FieldShape::Vector:
          writeVector(field, what);
          break;
        case CVLR_FieldShape::Matrix:
          writeMatrix(field, what);
          break;
        case CVLR_FieldShape::Multiple:
          writeMultiple(field, what);
          break;
      }
    }
    line(1, close(section.name()));
  }

  void writeVector(const CDescriptionField& field, const std::string& what) {
    const std::string vector = std::string(ElementTypeWord(field.type())) + "Vector";
    const std::string value = std::string(ElementTypeWord(field.type())) + "Value";
    line(2, open(field.name()));
    line(3, "<" + vector + attribute("NumberOfElements", field.columns()) + ">");
    for (int i = 0; i < field.columns(); ++i)
      line(4,
           "<" + value + attribute("ID", i) + ">" + elementText(field, 0, i, what) + close(value));
    line(3, close(vector));
    line(2, close(field.name()));
  }

  void writeMatrix(const CDescriptionField& field, const std::string& what) {
    const std::string matrix = std::string(ElementTypeWord(field.type())) + "Matrix";
    const std::string value = std::string(ElementTypeWord(field.type())) + "Value";
    line(2, open(field.name()));
    line(3, "<" + matrix + attribute("NumberOfRows", field.rows()) +
                attribute("NumberOfColumns", field.columns()) + ">");
    for (int r = 0; r < field.rows(); ++r) {
      line(4, "<MatrixRow" + attribute("ID", r) + ">");
      for (int c = 0; c < field.columns(); ++c)
        line(5, "<" + value + attribute("ID", c) + ">" + elementText(field, r, c, what) +
                    close(value));
      line(4, close("MatrixRow"));
    }
    line(3, close(matrix));
    line(2, close(field.name()));
  }

  void writeMultiple(const CDescriptionField& field, const std::string& what) {
    const auto& subs = field.subFields();
    int elements = 0;
    for (const auto& sub : subs) {
      requireName(sub.name(), what + "." + sub.name());
      elements = std::max(elements, sub.columns());
    }
    const std::string structs = "VectorOfStructs_" + field.name();
    const std::string values = "VectorOfStructsValues_" + field.name();
    line(2, open(field.name()));
    line(3, "<" + structs + attribute("NumberOfElements", elements) +
                attribute("NumberOfFields", static_cast<int>(subs.size())) + ">");
    for (int i = 0; i < elements; ++i) {
      line(4, "<" + values + attribute("ID", i) + ">");
      for (const auto& sub : subs)
        line(5, open(sub.name()) + elementText(sub, 0, i, what + "." + sub.name()) +
                    close(sub.name()));
      line(4, close(values));
    }
    line(3, close(structs));
    line(2, close(field.name()));
  }

  // The element of the previous file as it stood, at section indentation.
  void copyPrevious(const PreviousSection& section) {
    const FileHandle in(mPreviousPath.c_str(), "rb");
    if (!in || fseeko(in.get(), static_cast<off_t>(section.begin), SEEK_SET) != 0)
      throw WriteFailure{section.name, "previous header cannot be read"};
    put(kIndent);
    std::vector<char> buffer(kCopyChunkBytes);
    long long left = section.end - section.begin;
    while (left > 0) {
      const size_t want = static_cast<size_t>(std::min<long long>(left, buffer.size()));
      const size_t got = std::fread(buffer.data(), 1, want, in.get());
      if (got != want) throw WriteFailure{section.name, "previous header cannot be read"};
      if (std::fwrite(buffer.data(), 1, got, mFile) != got)
        throw WriteFailure{std::string(), "write failure"};
      left -= static_cast<long long>(got);
    }
    put("\n");
  }

  FILE* mFile;
  std::string mPreviousPath;
};

// The sections of the previous file that the header does not hold, each once.
std::vector<PreviousSection> sectionsToCarry(const CDescriptionHeader& header,
                                             const std::string& path) {
  std::vector<PreviousSection> carried;
  for (auto& section : previousSections(path)) {
    if (section.end <= section.begin || findSection(header, section.name.c_str()) != nullptr)
      continue;
    const bool seen = std::any_of(carried.begin(), carried.end(),
                                  [&](const PreviousSection& s) { return s.name == section.name; });
    if (!seen) carried.push_back(std::move(section));
  }
  return carried;
}

// The numeric value of a set Integer or Double field.
bool numberOf(const CDescriptionSection& section, const char* name, double& value) {
  const CDescriptionField* field = section.findField(name);
  if (field == nullptr || !field->isSet()) return false;
  if (field->type() == CVLR_FieldType::Integer) {
    value = field->getIntegerAt(0, 0);
    return true;
  }
  if (field->type() == CVLR_FieldType::Double) {
    value = field->getDoubleAt(0, 0);
    return true;
  }
  return false;
}

void setNumber(CDescriptionSection& section, const char* name, double value) {
  CDescriptionField* field = section.findField(name);
  if (field == nullptr || field->type() != CVLR_FieldType::Double) {
    NVLR_UTILITY_TracePrint("No Double field %s.%s for the map grid\n", section.name().c_str(),
                            name);
    return;
  }
  if (field->rows() < 1 || field->columns() < 1) field->resize(1, 1);
  field->setDoubleAt(0, 0, value);
}

bool isGeocoded(const CDescriptionSection& rasterInfo) {
  const CDescriptionField* field = rasterInfo.findField("GeocodedImage");
  if (field == nullptr || !field->isSet() || field->type() != CVLR_FieldType::String) return false;
  const std::string& text = field->getStringAt(0, 0);
  return text.size() == 2 && std::toupper(static_cast<unsigned char>(text[0])) == 'O' &&
         std::toupper(static_cast<unsigned char>(text[1])) == 'K';
}

// The map grid of a geocoded image from its size, spacing and corner.
void deriveMapGrid(CDescriptionHeader& header) {
  CDescriptionSection* raster = findSection(header, "RasterInfo");
  CDescriptionSection* registration = findSection(header, "RegistrationCoordinates");
  CDescriptionSection* dem = findSection(header, "DEMCoordinates");
  if (raster == nullptr || registration == nullptr || dem == nullptr || !isGeocoded(*raster))
    return;
  double lines, pixels, spacingNorth, spacingEast, north, east;
  if (!numberOf(*registration, "PixelSpacingLatNorth", spacingNorth) ||
      !numberOf(*registration, "PixelSpacingLonEast", spacingEast) ||
      !numberOf(*raster, "NrOfLinesPerImage", lines) ||
      !numberOf(*raster, "NrOfPixelsPerLine", pixels) ||
      !numberOf(*registration, "LatNorthing", north) ||
      !numberOf(*registration, "LonEasting", east))
    return;
  setNumber(*dem, "NorthingCoordinateBegin", lines * spacingNorth + north);
  setNumber(*dem, "NorthingGridSize", -spacingNorth);
  setNumber(*dem, "NorthingCoordinateEnd", north);
  setNumber(*dem, "EastingCoordinateBegin", east);
  setNumber(*dem, "EastingGridSize", spacingEast);
  setNumber(*dem, "EastingCoordinateEnd", pixels * spacingEast + east);
}

// "RasterInfo.OtherInfo" holds (key, value) rows; the "SOFTWARE" row names
// the program that wrote the header.
void setSoftwareEntry(CDescriptionHeader& header) {
  CDescriptionSection* raster = findSection(header, "RasterInfo");
  CDescriptionField* info = raster ? raster->findField("OtherInfo") : nullptr;
  if (info == nullptr || info->type() != CVLR_FieldType::String ||
      info->shape() != CVLR_FieldShape::Matrix)
    return;
  const std::string& software = NVLR_UTILITY_Identification();
  if (!info->isSet()) {
    info->clear();
    info->resize(1, 2);
    info->setStringAt(0, 0, kSoftwareKey);
    info->setStringAt(0, 1, software);
    return;
  }
  if (info->columns() < 2) info->resize(info->rows(), 2);
  for (int r = 0; r < info->rows(); ++r) {
    if (info->isSetAt(r, 0) && info->getStringAt(r, 0) == kSoftwareKey) {
      info->setStringAt(r, 1, software);
      return;
    }
  }
  const int row = info->rows();
  info->resize(row + 1, info->columns());
  info->setStringAt(row, 0, kSoftwareKey);
  info->setStringAt(row, 1, software);
}

}  // namespace

void writeXML(const CDescriptionHeader& header, const char* path) {
  const std::string target = path ? path : "";
  std::unique_ptr<TemporaryFile> temporary;
  try {
    const std::vector<PreviousSection> carried = sectionsToCarry(header, target);
    temporary = std::make_unique<TemporaryFile>(target);
    XmlHeaderWriter(temporary->file(), target).write(header, carried);
    temporary->commit();
  } catch (const WriteFailure& failure) {
    // Gone before the raise, which ends the process in a real run.
    temporary.reset();
    NVLR_UTILITY_TracePrint("%s : %s\n%s\n", failure.reason.c_str(), failure.what.c_str(),
                            target.c_str());
    const std::string extra = failure.what.empty() ? target : target + " : " + failure.what;
    NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModuleXml, __LINE__, extra.c_str());
  }
}

void writeHeader(CDescriptionHeader& header, const char* fileName) {
  deriveMapGrid(header);
  setSoftwareEntry(header);
  std::string name = fileName ? fileName : "";
  NVLR_UTILITY_RemoveSuffix(name, "_hdr");
  NVLR_UTILITY_RemoveSuffix(name, ".sml");
  writeXML(header, (name + ".sml").c_str());
  NVLR_UTILITY_WriteEnviHeader(header, fileName ? fileName : "");
}
