// The "_hdr" text form of suite headers (also the form of the installation's
// ".des" description files), and the mandatory-field check.
//
// Grammar of the text form:
//   * Lines end at LF; a CR before the LF is dropped.  Blank lines and lines
//     whose first non-blank character is '#' or ';' are skipped.  A line
//     longer than 1 MiB makes the file unreadable (261121).
//   * "[Name]" opens the section Name; so do "Name {" and a line "Name"
//     followed by a line "{".  A section ends at a line "}", at the next
//     section line or at the end of the file (ENVISAT product headers copied
//     under a "[EnvisatFixHeader]" line have no braces).
//   * Inside a section "Field = values" sets a field (blanks around '=' are
//     optional, as in ENVISAT's KEY=value).  Values are separated by commas
//     and the blanks around each are dropped; a value in double quotes is
//     taken literally up to the closing quote (commas and braces kept).  An
//     ENVISAT unit suffix such as <s> stays part of the text.  An empty value
//     leaves its element unset; "" is the empty string.
//       - A String Scalar takes the whole text after '=' (a single quoted
//         value without its quotes), so a text holding commas is kept whole.
//       - A numeric Scalar takes exactly one value.
//       - A Vector takes as many values as are listed (resized to that count).
//       - A Matrix given values on one line is one row of them; a Multiple
//         given values on one line is one structure.
//   * "Field = {" opens a block ended by a line "}": for a Matrix one row a
//     line (values separated by commas, all rows of the same length), for a
//     Multiple one structure a line (its sub-field values in definition
//     order).
//   * Fields and sections the header does not define are skipped, so are
//     lines without '=' inside a section; a field given twice keeps the last
//     value.
//   * Numbers must parse whole ("NaN" is a NaN); anything else makes the
//     file unreadable (261121, naming the field).
#include <algorithm>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "suite/description_header.h"
#include "suite/description_io.h"
#include "suite/number_text.h"

namespace vlr_header_io {

namespace {

constexpr size_t kLineChunkBytes = 1u << 16;
constexpr const char* kBlanks = " \t";
constexpr const char* kMandatoryListName = "vlr_raster_file";
constexpr const char* kMandatorySuffix = ".mandatory";

}  // namespace

std::string Trimmed(const std::string& text) {
  const size_t first = text.find_first_not_of(kBlanks);
  if (first == std::string::npos) return std::string();
  return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

LineReader::LineReader(const std::string& path) : mPath(path), mFile(path.c_str(), "rb") {}

LineReader::~LineReader() = default;

bool LineReader::fill() {
  if (mBuffer.empty()) mBuffer.resize(kLineChunkBytes);
  mPosition = 0;
  mEnd = std::fread(mBuffer.data(), 1, mBuffer.size(), mFile.get());
  return mEnd > 0;
}

bool LineReader::next(std::string& line) {
  line.clear();
  if (!mFile.valid() || mOverlong) return false;
  bool any = false;
  for (;;) {
    if (mPosition >= mEnd && !fill()) break;
    any = true;
    const char* start = mBuffer.data() + mPosition;
    const void* lf = std::memchr(start, '\n', mEnd - mPosition);
    const size_t take =
        lf ? static_cast<size_t>(static_cast<const char*>(lf) - start) : mEnd - mPosition;
    if (line.size() + take > kMaxTextLineBytes) {
      ++mLineNumber;
      mOverlong = true;
      line.clear();
      return false;
    }
    line.append(start, take);
    mPosition += take;
    if (lf != nullptr) {
      ++mPosition;
      break;
    }
  }
  if (!any) return false;
  ++mLineNumber;
  if (!line.empty() && line.back() == '\r') line.pop_back();
  return true;
}

namespace {

// One "Field = ..." record: the text after '=' or, for a block, its lines.
struct TextEntry {
  std::string field;
  std::string text;
  bool block = false;
  std::vector<std::string> rows;
};

struct TextValue {
  std::string text;
  bool quoted = false;
};

// Splits a value list at commas; a quoted value keeps its commas.
std::vector<TextValue> splitValues(const std::string& text) {
  std::vector<TextValue> values;
  if (Trimmed(text).empty()) return values;
  const size_t n = text.size();
  size_t i = 0;
  for (;;) {
    while (i < n && (text[i] == ' ' || text[i] == '\t')) ++i;
    TextValue value;
    if (i < n && text[i] == '"') {
      const size_t close = text.find('"', i + 1);
      value.quoted = true;
      value.text =
          text.substr(i + 1, close == std::string::npos ? std::string::npos : close - i - 1);
      i = close == std::string::npos ? n : close + 1;
    }
    const size_t comma = std::min(text.find(',', i), n);
    value.text += Trimmed(text.substr(i, comma - i));
    values.push_back(std::move(value));
    if (comma >= n) break;
    i = comma + 1;
  }
  return values;
}

// Reads the significant lines of a text-form file and hands each record of a
// wanted section to the caller.
class TextFileParser {
 public:
  using SectionFn = std::function<bool(const std::string&)>;
  using EntryFn = std::function<void(const TextEntry&)>;

  explicit TextFileParser(const std::string& path) : mPath(path), mReader(path) {}
  bool isOpen() const { return mReader.isOpen(); }

  void run(const SectionFn& onSection, const EntryFn& onEntry) {
    bool wanted = false;
    std::string line;
    while (nextSignificant(line)) {
      std::string name;
      if (sectionLine(line, name)) {
        wanted = onSection(name);
        continue;
      }
      if (line == "}") {
        wanted = false;
        continue;
      }
      const size_t eq = line.find('=');
      if (eq == std::string::npos) continue;
      TextEntry entry;
      entry.field = Trimmed(line.substr(0, eq));
      entry.text = Trimmed(line.substr(eq + 1));
      if (entry.text == "{") {
        entry.block = true;
        readBlock(entry, wanted);
      }
      if (wanted) onEntry(entry);
    }
  }

 private:
  bool nextSignificant(std::string& line) {
    if (mHasPending) {
      mHasPending = false;
      line.swap(mPending);
      return true;
    }
    std::string raw;
    while (mReader.next(raw)) {
      line = Trimmed(raw);
      if (line.empty() || line[0] == '#' || line[0] == ';') continue;
      return true;
    }
    if (mReader.overlong())
      RaiseParseError(kModuleSection, __LINE__, mPath,
                      "line " + std::to_string(mReader.lineNumber()), "line longer than 1 MiB");
    return false;
  }

  static bool isName(const std::string& text) {
    return !text.empty() && text.find_first_of(" \t{}[]=") == std::string::npos;
  }

  // "[Name]", "Name {", or "Name" followed by a line "{".
  bool sectionLine(const std::string& line, std::string& name) {
    if (line.size() > 2 && line.front() == '[' && line.back() == ']') {
      name = Trimmed(line.substr(1, line.size() - 2));
      return !name.empty();
    }
    if (line.find('=') != std::string::npos) return false;
    if (line.size() > 1 && line.back() == '{') {
      name = Trimmed(line.substr(0, line.size() - 1));
      return isName(name);
    }
    if (!isName(line)) return false;
    std::string following;
    if (nextSignificant(following)) {
      if (following == "{") {
        name = line;
        return true;
      }
      mPending.swap(following);
      mHasPending = true;
    }
    return false;
  }

  // The lines up to "}"; kept only for a wanted section, and never more of
  // them than one field may hold.
  void readBlock(TextEntry& entry, bool keep) {
    std::string line;
    while (nextSignificant(line)) {
      if (line == "}") return;
      if (!keep) continue;
      if (entry.rows.size() >= static_cast<size_t>(CVLR_DS_MAX_ELEMENTS))
        RaiseParseError(kModuleSection, __LINE__, mPath, entry.field, "block with too many lines");
      entry.rows.push_back(line);
    }
  }

  std::string mPath;
  LineReader mReader;
  std::string mPending;
  bool mHasPending = false;
};

// Stores the records of one section into its fields.
class TextSectionFiller {
 public:
  TextSectionFiller(CDescriptionSection& section, const std::string& path)
      : mSection(section), mPath(path) {}

  void apply(const TextEntry& entry) {
    CDescriptionField* field = mSection.findField(entry.field);
    if (field == nullptr) return;
    mWhat = mSection.name() + "." + field->name();
    field->clear();
    if (entry.block) {
      applyBlock(*field, entry.rows);
    } else {
      applyLine(*field, entry.text);
    }
  }

 private:
  [[noreturn]] void fail(const std::string& reason) const {
    RaiseParseError(kModuleSection, __LINE__, mPath, mWhat, reason);
  }

  void applyLine(CDescriptionField& field, const std::string& text) {
    if (field.shape() == CVLR_FieldShape::Multiple) {
      applyStructures(field, {text});
      return;
    }
    if (field.shape() == CVLR_FieldShape::Scalar) {
      if (field.rows() < 1 || field.columns() < 1) field.resize(1, 1);
      applyScalar(field, text);
      return;
    }
    const std::vector<TextValue> values = splitValues(text);
    field.resize(1, static_cast<int>(values.size()));
    for (size_t c = 0; c < values.size(); ++c) store(field, 0, static_cast<int>(c), values[c]);
  }

  void applyScalar(CDescriptionField& field, const std::string& text) {
    if (field.type() == CVLR_FieldType::String) {
      TextValue whole;
      const size_t close = text.size() > 1 && text[0] == '"' ? text.find('"', 1) : 0;
      whole.quoted = close == text.size() - 1 && close > 0;
      whole.text = whole.quoted ? text.substr(1, text.size() - 2) : text;
      store(field, 0, 0, whole);
      return;
    }
    const std::vector<TextValue> values = splitValues(text);
    if (values.size() > 1) fail("more than one value for a scalar: [" + text.substr(0, 64) + "]");
    if (!values.empty()) store(field, 0, 0, values[0]);
  }

  void applyBlock(CDescriptionField& field, const std::vector<std::string>& rows) {
    if (field.shape() == CVLR_FieldShape::Multiple) {
      applyStructures(field, rows);
      return;
    }
    if (field.shape() != CVLR_FieldShape::Matrix) fail("a block of lines for a scalar or vector");
    std::vector<std::vector<TextValue>> table;
    for (const auto& row : rows) {
      table.push_back(splitValues(row));
      if (table.back().size() != table.front().size()) fail("matrix rows of different lengths");
    }
    const size_t columns = table.empty() ? 0 : table.front().size();
    if (table.size() * columns > static_cast<size_t>(CVLR_DS_MAX_ELEMENTS))
      fail("matrix too large");
    field.resize(static_cast<int>(table.size()), static_cast<int>(columns));
    for (size_t r = 0; r < table.size(); ++r)
      for (size_t c = 0; c < columns; ++c)
        store(field, static_cast<int>(r), static_cast<int>(c), table[r][c]);
  }

  void applyStructures(CDescriptionField& field, const std::vector<std::string>& rows) {
    auto& subs = field.subFields();
    field.setNumberOfElements(static_cast<int>(rows.size()));
    const std::string fieldWhat = mWhat;
    for (size_t r = 0; r < rows.size(); ++r) {
      const std::vector<TextValue> values = splitValues(rows[r]);
      if (values.size() > subs.size())
        fail("structure with " + std::to_string(values.size()) + " values for " +
             std::to_string(subs.size()) + " sub-fields");
      for (size_t k = 0; k < values.size(); ++k) {
        mWhat = fieldWhat + "." + subs[k].name();
        store(subs[k], 0, static_cast<int>(r), values[k]);
      }
      mWhat = fieldWhat;
    }
  }

  void store(CDescriptionField& field, int row, int column, const TextValue& value) {
    if (value.text.empty() && !value.quoted) return;
    switch (field.type()) {
      case CVLR_FieldType::Integer: {
        int v = 0;
        if (!NVLR_UTILITY_ParseInteger(value.text, v))
          fail("not a 32-bit integer: [" + value.text.substr(0, 64) + "]");
        field.setIntegerAt(row, column, v);
        return;
      }
      case CVLR_FieldType::Double: {
        double v = 0.0;
        if (!NVLR_UTILITY_ParseDouble(value.text, v))
          fail("not a number: [" + value.text.substr(0, 64) + "]");
        field.setDoubleAt(row, column, v);
        return;
      }
      case CVLR_FieldType::String:
        field.setStringAt(row, column, value.text);
        return;
      case CVLR_FieldType::FieldOfSection:
        return;
    }
  }

  CDescriptionSection& mSection;
  const std::string& mPath;
  std::string mWhat;
};

}  // namespace

bool ReadTextSection(CDescriptionSection& section, const std::string& path) {
  TextFileParser parser(path);
  if (!parser.isOpen()) return false;
  TextSectionFiller filler(section, path);
  bool found = false;
  parser.run(
      [&](const std::string& name) {
        const bool wanted = name == section.name();
        found = found || wanted;
        return wanted;
      },
      [&](const TextEntry& entry) { filler.apply(entry); });
  return found;
}

}  // namespace vlr_header_io

using namespace vlr_header_io;

bool readTextHeaderFile(CDescriptionHeader& header, const char* path) {
  if (path == nullptr || !NVLR_UTILITY_IsRegularFile(path)) return false;
  TextFileParser parser(path);
  if (!parser.isOpen()) return false;
  const std::string file = path;
  CDescriptionSection* current = nullptr;
  parser.run(
      [&](const std::string& name) {
        current = findSection(header, name.c_str());
        return current != nullptr;
      },
      [&](const TextEntry& entry) { TextSectionFiller(*current, file).apply(entry); });
  return true;
}

namespace {

// "Section Field" (blank or tab between) or "Section.Field"; false for a
// line that names neither.
bool mandatoryEntry(const std::string& line, std::string& section, std::string& field) {
  const std::string t = Trimmed(line);
  if (t.empty() || t[0] == '#') return false;
  const size_t gap = t.find_first_of(kBlanks);
  if (gap != std::string::npos) {
    section = t.substr(0, gap);
    field = Trimmed(t.substr(gap));
    const size_t end = field.find_first_of(kBlanks);
    if (end != std::string::npos) field.resize(end);
  } else {
    const size_t dot = t.find('.');
    if (dot == std::string::npos) return false;
    section = t.substr(0, dot);
    field = t.substr(dot + 1);
  }
  return !section.empty() && !field.empty();
}

}  // namespace

void checkMandatoryFields(CDescriptionHeader& header) {
  std::string listPath = kMandatoryListName;
  if (!NVLR_UTILITY_IsRegularFile(listPath.c_str()))
    listPath =
        NVLR_UTILITY_EnvValue("VELORAN_MANDATORY_DIR") + kMandatoryListName + kMandatorySuffix;
  LineReader reader(listPath);
  if (!reader.isOpen()) {
    NVLR_UTILITY_TracePrint("No mandatory field list : %s\n", listPath.c_str());
    return;
  }
  std::string line;
  std::string sectionName;
  std::string fieldName;
  while (reader.next(line)) {
    if (!mandatoryEntry(line, sectionName, fieldName)) continue;
    CDescriptionSection* section = findSection(header, sectionName.c_str());
    const CDescriptionField* field = section ? section->findField(fieldName) : nullptr;
    if (field == nullptr || !field->isSet())
      NVLR_UTILITY_LogPrint("Mandatory Field [%s] is not found in [%s] section\n",
                            fieldName.c_str(), sectionName.c_str());
  }
  if (reader.overlong())
    NVLR_UTILITY_TracePrint("Mandatory field list line %d too long : %s\n", reader.lineNumber(),
                            listPath.c_str());
}
