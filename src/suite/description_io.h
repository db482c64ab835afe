// Internals shared by the header readers and writer: the element tree that
// the ".sml" reader builds, the section reader over it, the text-form section
// reader and a bounded line reader.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "runtime/file_handle.h"
#include "suite/description_field.h"

class CDescriptionHeader;
class CDescriptionSection;

namespace vlr_header_io {

// Longest field value a header file may hold.  Values of any length up to
// this read fine; longer ones are refused instead of growing without bound.
constexpr size_t kMaxFieldTextBytes = 1u << 20;
// Most elements one ".sml" file may hold.
constexpr size_t kMaxXmlNodes = 1000000;
// Longest line of a text-form header or list file.
constexpr size_t kMaxTextLineBytes = 1u << 20;

constexpr const char* kModuleSection = "vlr_description_section";
constexpr const char* kModuleXml = "vlr_description_xml";

constexpr int kNoNode = -1;

// One element of a parsed XML file.  Children form a singly linked list in
// document order; names are interned in the tree.
struct XmlNode {
  int name = 0;
  int parent = kNoNode;
  int firstChild = kNoNode;
  int lastChild = kNoNode;
  int nextSibling = kNoNode;
  int childCount = 0;
  int firstAttribute = 0;
  int attributeCount = 0;
  // The element's own text; kept only while it has no child elements (the
  // blanks between children are layout, not data).
  std::string text;
  // Set when some of the text came from an entity or character reference,
  // so that a written "&quot;&quot;" is not taken for the empty-string mark.
  bool textHasReference = false;
};

struct XmlTree {
  std::vector<XmlNode> nodes;  // nodes[0] is the document element
  std::vector<std::pair<int, std::string>> attributes;
  std::vector<std::string> names;
  std::unordered_map<std::string, int> nameIds;

  // -1 when no element in the file has that name.
  int nameId(const std::string& name) const;
  const std::string& nameOf(int node) const { return names[static_cast<size_t>(nodes[node].name)]; }
  // Null when the element has no such attribute.
  const std::string* attribute(int node, const char* name) const;
  // The first child of that name, or kNoNode.
  int child(int node, const std::string& name) const;
  // The first element of that name below node in document order, or kNoNode.
  int descendant(int node, const std::string& name) const;
};

// Parses the file through Expat with Latin-1 as its encoding.  A file that
// does not parse, holds more than kMaxXmlNodes elements or a text longer
// than kMaxFieldTextBytes raises 261121 with the file name.
XmlTree ParseXmlFile(const std::string& path);

// Reads the fields of section from the element node (a section element of a
// ".sml" file or a SECTION of a description document).  Malformed values
// raise 261121 with the file name and the field.
void ReadSectionElement(const XmlTree& tree, int node, CDescriptionSection& section,
                        const std::string& path);

// The element holding section below root: a child of that name, else the
// first descendant of that name; kNoNode when the file has none.
int FindSectionElement(const XmlTree& tree, int root, const std::string& section);

// Reads one section from a text-form file; false when the file has no such
// section.  Raises 261121 for malformed lines or values.
bool ReadTextSection(CDescriptionSection& section, const std::string& path);

// Raises 261121 with "<path> : <what>" after a trace line with the reason.
[[noreturn]] void RaiseParseError(const char* module, int line, const std::string& path,
                                  const std::string& what, const std::string& reason);

// Reads a file line by line: a CR before the LF is dropped and the last line
// may lack its LF.  A line longer than kMaxTextLineBytes ends the reading
// with overlong() set.
class LineReader {
 public:
  explicit LineReader(const std::string& path);
  ~LineReader();
  LineReader(const LineReader&) = delete;
  LineReader& operator=(const LineReader&) = delete;

  bool isOpen() const { return mFile.valid(); }
  // False at the end of the file or at an over-long line.
  bool next(std::string& line);
  bool overlong() const { return mOverlong; }
  int lineNumber() const { return mLineNumber; }

 private:
  bool fill();

  std::string mPath;
  FileHandle mFile;
  int mLineNumber = 0;
  bool mOverlong = false;
  std::vector<char> mBuffer;
  size_t mPosition = 0;
  size_t mEnd = 0;
};

// The word that names a field's data type in element names ("DoubleVector",
// "IntegerValue"...).
inline const char* ElementTypeWord(CVLR_FieldType type) {
  switch (type) {
    case CVLR_FieldType::Integer:
      return "Integer";
    case CVLR_FieldType::Double:
      return "Double";
    case CVLR_FieldType::String:
      return "String";
    case CVLR_FieldType::FieldOfSection:
      break;
  }
  return "EFDT";
}

// The entity that stands for one of the markup characters & < > " ', or null
// for any other character.
inline const char* XmlEntity(char c) {
  switch (c) {
    case '&':
      return "&amp;";
    case '<':
      return "&lt;";
    case '>':
      return "&gt;";
    case '"':
      return "&quot;";
    case '\'':
      return "&apos;";
    default:
      return nullptr;
  }
}

// The text without blanks and tabs around it.
std::string Trimmed(const std::string& text);

// Appends UTF-8 text as Latin-1 bytes; false for a character above 255.
bool AppendLatin1(std::string& out, const char* text, size_t length);

}  // namespace vlr_header_io
