// Reading suite headers: the ".sml" XML form through Expat, the section
// description documents, and the choice between ".sml" and the "_hdr" text
// form.
//
// The files are Latin-1 text.  The parser is created with ISO-8859-1 as the
// external encoding, which overrides the file's declaration, so every byte
// from 128 to 255 is one character; Expat hands the text over in UTF-8 and it
// is turned back into single bytes here.  Entities (&amp; &lt; &gt; &quot;
// &apos;) and character references (&#9; &#10; &#13;) are resolved by the
// parser, so a value reads back exactly as it was written.
#include <expat.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "runtime/error_codes.h"
#include "runtime/file_handle.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "suite/description_header.h"
#include "suite/description_io.h"
#include "suite/number_text.h"

namespace vlr_header_io {

bool AppendLatin1(std::string& out, const char* text, size_t length) {
  for (size_t i = 0; i < length; ++i) {
    const unsigned char c = static_cast<unsigned char>(text[i]);
    if (c < 0x80) {
      out.push_back(static_cast<char>(c));
    } else if ((c == 0xC2 || c == 0xC3) && i + 1 < length) {
      const unsigned char next = static_cast<unsigned char>(text[++i]);
      out.push_back(static_cast<char>(((c & 0x03u) << 6) | (next & 0x3Fu)));
    } else {
      return false;
    }
  }
  return true;
}

namespace {

constexpr size_t kReadChunkBytes = 1u << 16;
// The text of a value written as an empty string.
constexpr const char* kEmptyStringMark = "\"\"";

// The state the Expat callbacks share.  A callback never raises (that would
// unwind through C code): it records the failure and stops the parser.
struct ParseState {
  XML_Parser parser = nullptr;
  XmlTree tree;
  std::vector<int> open;
  bool failed = false;
  std::string failWhat;
  std::string failReason;

  void fail(const std::string& what, const std::string& reason) {
    if (failed) return;
    failed = true;
    failWhat = what;
    failReason = reason;
    if (parser != nullptr) XML_StopParser(parser, XML_FALSE);
  }

  int intern(const std::string& name) {
    const auto it = tree.nameIds.find(name);
    if (it != tree.nameIds.end()) return it->second;
    const int id = static_cast<int>(tree.names.size());
    tree.names.push_back(name);
    tree.nameIds.emplace(name, id);
    return id;
  }
};

// The number of characters in a UTF-8 text.
size_t characterCount(const char* text, size_t length) {
  size_t count = 0;
  for (size_t i = 0; i < length; ++i)
    if ((static_cast<unsigned char>(text[i]) & 0xC0u) != 0x80u) ++count;
  return count;
}

std::string latin1OrFail(ParseState& s, const char* text, const std::string& where) {
  std::string out;
  const size_t length = std::strlen(text);
  if (length > kMaxFieldTextBytes) {
    s.fail(where, "attribute value longer than 1 MiB");
  } else if (!AppendLatin1(out, text, length)) {
    s.fail(where, "character that Latin-1 cannot hold");
  }
  return out;
}

void XMLCALL startElement(void* data, const XML_Char* name, const XML_Char** attributes) {
  auto& s = *static_cast<ParseState*>(data);
  if (s.failed) return;
  XmlTree& tree = s.tree;
  if (tree.nodes.size() >= kMaxXmlNodes) {
    s.fail(name, "more than 1000000 elements");
    return;
  }
  const std::string elementName = latin1OrFail(s, name, name);
  XmlNode node;
  node.name = s.intern(elementName);
  node.firstAttribute = static_cast<int>(tree.attributes.size());
  for (int i = 0; attributes[i] != nullptr; i += 2) {
    const int attributeName = s.intern(latin1OrFail(s, attributes[i], elementName));
    tree.attributes.emplace_back(attributeName, latin1OrFail(s, attributes[i + 1], elementName));
    ++node.attributeCount;
  }
  const int id = static_cast<int>(tree.nodes.size());
  if (!s.open.empty()) {
    node.parent = s.open.back();
    XmlNode& parent = tree.nodes[static_cast<size_t>(node.parent)];
    if (parent.lastChild == kNoNode) {
      parent.firstChild = id;
      // From here on the parent's text is only layout between children.
      parent.text.clear();
      parent.text.shrink_to_fit();
    } else {
      tree.nodes[static_cast<size_t>(parent.lastChild)].nextSibling = id;
    }
    parent.lastChild = id;
    ++parent.childCount;
  }
  tree.nodes.push_back(std::move(node));
  s.open.push_back(id);
}

void XMLCALL endElement(void* data, const XML_Char*) {
  auto& s = *static_cast<ParseState*>(data);
  if (!s.open.empty()) s.open.pop_back();
}

void XMLCALL characterData(void* data, const XML_Char* text, int length) {
  auto& s = *static_cast<ParseState*>(data);
  if (s.failed || s.open.empty() || length <= 0) return;
  XmlNode& node = s.tree.nodes[static_cast<size_t>(s.open.back())];
  if (node.childCount > 0) return;
  const size_t n = static_cast<size_t>(length);
  // A literal run is one input byte per character; a reference is longer.
  if (static_cast<size_t>(XML_GetCurrentByteCount(s.parser)) != characterCount(text, n))
    node.textHasReference = true;
  if (!AppendLatin1(node.text, text, n)) {
    s.fail(s.tree.nameOf(s.open.back()), "character that Latin-1 cannot hold");
  } else if (node.text.size() > kMaxFieldTextBytes) {
    s.fail(s.tree.nameOf(s.open.back()), "value longer than 1 MiB");
  }
}

struct ParserFree {
  void operator()(XML_Parser p) const { XML_ParserFree(p); }
};

// Feeds the stream to the parser; false on a failure, with the failure traced.
bool feedParser(FILE* file, XML_Parser parser, ParseState& state, const std::string& path) {
  std::vector<char> buffer(kReadChunkBytes);
  bool done = false;
  while (!done) {
    const size_t got = std::fread(buffer.data(), 1, buffer.size(), file);
    if (std::ferror(file)) {
      state.fail(std::string(), "read failure");
      return false;
    }
    done = got < buffer.size();
    if (XML_Parse(parser, buffer.data(), static_cast<int>(got), done ? 1 : 0) != XML_STATUS_OK) {
      if (!state.failed) {
        NVLR_UTILITY_TracePrint("%s at line %d\n%s\n", XML_ErrorString(XML_GetErrorCode(parser)),
                                static_cast<int>(XML_GetCurrentLineNumber(parser)), path.c_str());
        state.fail(std::string(), "not well-formed");
      }
      return false;
    }
  }
  return !state.failed;
}

// Parses the open stream into the state's tree.
bool parseStream(FILE* file, ParseState& state, const std::string& path) {
  std::unique_ptr<XML_ParserStruct, ParserFree> parser(XML_ParserCreate("ISO-8859-1"));
  if (!parser) {
    state.fail(std::string(), "parser cannot be created");
    return false;
  }
  XML_SetUserData(parser.get(), &state);
  XML_SetElementHandler(parser.get(), startElement, endElement);
  XML_SetCharacterDataHandler(parser.get(), characterData);
  state.parser = parser.get();
  const bool ok = feedParser(file, parser.get(), state, path);
  state.parser = nullptr;
  return ok;
}

}  // namespace

int XmlTree::nameId(const std::string& name) const {
  const auto it = nameIds.find(name);
  return it == nameIds.end() ? -1 : it->second;
}

const std::string* XmlTree::attribute(int node, const char* name) const {
  const int id = nameId(name);
  if (id < 0) return nullptr;
  const XmlNode& n = nodes[static_cast<size_t>(node)];
  for (int i = 0; i < n.attributeCount; ++i) {
    const auto& a = attributes[static_cast<size_t>(n.firstAttribute + i)];
    if (a.first == id) return &a.second;
  }
  return nullptr;
}

int XmlTree::child(int node, const std::string& name) const {
  const int id = nameId(name);
  if (id < 0) return kNoNode;
  for (int c = nodes[static_cast<size_t>(node)].firstChild; c != kNoNode;
       c = nodes[static_cast<size_t>(c)].nextSibling)
    if (nodes[static_cast<size_t>(c)].name == id) return c;
  return kNoNode;
}

int XmlTree::descendant(int node, const std::string& name) const {
  const int id = nameId(name);
  if (id < 0) return kNoNode;
  // Nodes are stored in document order and a subtree is contiguous.
  const int end = static_cast<int>(nodes.size());
  for (int n = node + 1; n < end; ++n) {
    int p = nodes[static_cast<size_t>(n)].parent;
    if (p < node) break;
    if (nodes[static_cast<size_t>(n)].name == id) return n;
  }
  return kNoNode;
}

void RaiseParseError(const char* module, int line, const std::string& path, const std::string& what,
                     const std::string& reason) {
  NVLR_UTILITY_TracePrint("%s : %s\n%s\n", reason.c_str(), what.c_str(), path.c_str());
  const std::string extra = what.empty() ? path : path + " : " + what;
  NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, module, line, extra.c_str());
}

XmlTree ParseXmlFile(const std::string& path) {
  ParseState state;
  {
    const FileHandle file(path.c_str(), "rb");
    if (!file) {
      state.fail(std::string(), "file cannot be opened");
    } else {
      parseStream(file.get(), state, path);
    }
  }
  if (state.failed) RaiseParseError(kModuleXml, __LINE__, path, state.failWhat, state.failReason);
  return std::move(state.tree);
}

int FindSectionElement(const XmlTree& tree, int root, const std::string& section) {
  const int direct = tree.child(root, section);
  return direct != kNoNode ? direct : tree.descendant(root, section);
}

namespace {

// Reads the fields of one section element; every failure names the file and
// "Section.Field".
class SectionReader {
 public:
  SectionReader(const XmlTree& tree, CDescriptionSection& section, const std::string& path)
      : mTree(tree), mSection(section), mPath(path) {}

  void read(int sectionNode) {
    // First child of each name, so that every field is found in one pass.
    std::unordered_map<int, int> children;
    for (int c = node(sectionNode).firstChild; c != kNoNode; c = node(c).nextSibling)
      children.emplace(node(c).name, c);
    for (int i = 0; i < mSection.fieldCount(); ++i) {
      CDescriptionField& field = mSection.field(i);
      const int id = mTree.nameId(field.name());
      const auto it = id < 0 ? children.end() : children.find(id);
      if (it == children.end()) continue;
      mWhat = mSection.name() + "." + field.name();
      readField(field, it->second);
    }
  }

 private:
  const XmlNode& node(int n) const { return mTree.nodes[static_cast<size_t>(n)]; }

  [[noreturn]] void fail(const std::string& reason) const {
    RaiseParseError(kModuleXml, __LINE__, mPath, mWhat, reason);
  }

  void readField(CDescriptionField& field, int fieldNode) {
    field.clear();
    switch (field.shape()) {
      case CVLR_FieldShape::Scalar:
        if (field.rows() < 1 || field.columns() < 1) field.resize(1, 1);
        storeValue(field, 0, 0, fieldNode);
        break;
      case CVLR_FieldShape::Vector:
        readVector(field,
                   container(fieldNode, std::string(ElementTypeWord(field.type())) + "Vector"));
        break;
      case CVLR_FieldShape::Matrix:
        readMatrix(field,
                   container(fieldNode, std::string(ElementTypeWord(field.type())) + "Matrix"));
        break;
      case CVLR_FieldShape::Multiple:
        readMultiple(field, container(fieldNode, "VectorOfStructs_" + field.name()));
        break;
    }
  }

  // The element holding the values: the one of the expected name, else the
  // first child (a file written while the field had another data type).
  int container(int fieldNode, const std::string& name) const {
    const int c = mTree.child(fieldNode, name);
    return c != kNoNode ? c : node(fieldNode).firstChild;
  }

  // A count attribute: a whole number from 0 to the elements present.
  int count(int n, const char* attribute, int present) const {
    const std::string* text = mTree.attribute(n, attribute);
    if (text == nullptr) return present;
    int value = 0;
    if (!NVLR_UTILITY_ParseInteger(*text, value) || value < 0)
      fail(std::string(attribute) + " is not a count: [" + text->substr(0, 64) + "]");
    if (value > present || value > CVLR_DS_MAX_ELEMENTS)
      fail(std::string(attribute) + " " + std::to_string(value) + " exceeds the " +
           std::to_string(present) + " elements present");
    return value;
  }

  // The "ID" attribute of the ordinal-th child, checked against size.
  int elementIndex(int n, int ordinal, int size) const {
    const std::string* text = mTree.attribute(n, "ID");
    int value = ordinal;
    if (text != nullptr && !NVLR_UTILITY_ParseInteger(*text, value))
      fail("ID is not a number: [" + text->substr(0, 64) + "]");
    if (value < 0 || value >= size)
      fail("ID " + std::to_string(value) + " outside 0.." + std::to_string(size - 1));
    return value;
  }

  void readVector(CDescriptionField& field, int vectorNode) {
    if (vectorNode == kNoNode) return;
    const int n = count(vectorNode, "NumberOfElements", node(vectorNode).childCount);
    field.resize(1, n);
    int ordinal = 0;
    for (int c = node(vectorNode).firstChild; c != kNoNode; c = node(c).nextSibling, ++ordinal)
      storeValue(field, 0, elementIndex(c, ordinal, n), c);
  }

  void readMatrix(CDescriptionField& field, int matrixNode) {
    if (matrixNode == kNoNode) return;
    int widest = 0;
    for (int r = node(matrixNode).firstChild; r != kNoNode; r = node(r).nextSibling)
      widest = std::max(widest, node(r).childCount);
    const int rows = count(matrixNode, "NumberOfRows", node(matrixNode).childCount);
    // A matrix without rows (an empty polynomial family, say) still states
    // its width; it holds no element, so any width up to the limit is fine.
    const int columns =
        count(matrixNode, "NumberOfColumns", rows == 0 ? CVLR_DS_MAX_ELEMENTS : widest);
    if (static_cast<long long>(rows) * columns > CVLR_DS_MAX_ELEMENTS)
      fail("matrix of " + std::to_string(rows) + " x " + std::to_string(columns) + " is too large");
    field.resize(rows, columns);
    int rowOrdinal = 0;
    for (int r = node(matrixNode).firstChild; r != kNoNode; r = node(r).nextSibling, ++rowOrdinal) {
      const int row = elementIndex(r, rowOrdinal, rows);
      int ordinal = 0;
      for (int c = node(r).firstChild; c != kNoNode; c = node(c).nextSibling, ++ordinal)
        storeValue(field, row, elementIndex(c, ordinal, columns), c);
    }
  }

  void readMultiple(CDescriptionField& field, int structsNode) {
    if (structsNode == kNoNode) return;
    const int n = count(structsNode, "NumberOfElements", node(structsNode).childCount);
    field.setNumberOfElements(n);
    std::unordered_map<int, int> subIndex;
    auto& subs = field.subFields();
    for (size_t k = 0; k < subs.size(); ++k) {
      const int id = mTree.nameId(subs[k].name());
      if (id >= 0) subIndex.emplace(id, static_cast<int>(k));
    }
    const std::string fieldWhat = mWhat;
    int ordinal = 0;
    for (int e = node(structsNode).firstChild; e != kNoNode; e = node(e).nextSibling, ++ordinal) {
      const int index = elementIndex(e, ordinal, n);
      for (int v = node(e).firstChild; v != kNoNode; v = node(v).nextSibling) {
        const auto it = subIndex.find(node(v).name);
        if (it == subIndex.end()) continue;
        CDescriptionField& sub = subs[static_cast<size_t>(it->second)];
        mWhat = fieldWhat + "." + sub.name();
        storeValue(sub, 0, index, v);
      }
      mWhat = fieldWhat;
    }
  }

  // Empty text leaves the element unset; a text written as two double quotes
  // is the empty string.
  void storeValue(CDescriptionField& field, int row, int column, int valueNode) {
    const XmlNode& n = node(valueNode);
    const std::string& text = n.text;
    switch (field.type()) {
      case CVLR_FieldType::Integer: {
        if (Trimmed(text).empty()) return;
        int value = 0;
        if (!NVLR_UTILITY_ParseInteger(text, value))
          fail("not a 32-bit integer: [" + text.substr(0, 64) + "]");
        field.setIntegerAt(row, column, value);
        return;
      }
      case CVLR_FieldType::Double: {
        if (Trimmed(text).empty()) return;
        double value = 0.0;
        if (!NVLR_UTILITY_ParseDouble(text, value))
          fail("not a number: [" + text.substr(0, 64) + "]");
        field.setDoubleAt(row, column, value);
        return;
      }
      case CVLR_FieldType::String:
        if (text.empty()) return;
        if (text == kEmptyStringMark && !n.textHasReference) {
          field.setStringAt(row, column, std::string());
        } else {
          field.setStringAt(row, column, text);
        }
        return;
      case CVLR_FieldType::FieldOfSection:
        return;
    }
  }

  const XmlTree& mTree;
  CDescriptionSection& mSection;
  const std::string& mPath;
  std::string mWhat;
};

// The SECTION element of a section description document whose "NAME" is
// the section's, or kNoNode.
int descriptionSection(const XmlTree& tree, const std::string& section) {
  const int id = tree.nameId("SECTION");
  if (id < 0) return kNoNode;
  for (int c = tree.nodes[0].firstChild; c != kNoNode;
       c = tree.nodes[static_cast<size_t>(c)].nextSibling) {
    if (tree.nodes[static_cast<size_t>(c)].name != id) continue;
    const std::string* name = tree.attribute(c, "NAME");
    if (name != nullptr && *name == section) return c;
  }
  return kNoNode;
}

bool isDescriptionDocument(const XmlTree& tree) {
  return tree.attribute(0, "NumberOfElements") != nullptr && tree.child(0, "SECTION") != kNoNode;
}

// The root element of a header: the document element when it has the tag,
// else the first element of that name.
int headerRoot(const XmlTree& tree, const std::string& tag) {
  if (tree.nameOf(0) == tag) return 0;
  return tree.descendant(0, tag);
}

int requireRoot(const XmlTree& tree, const std::string& tag, const std::string& path) {
  const int root = headerRoot(tree, tag);
  if (root == kNoNode) {
    NVLR_UTILITY_TracePrint("NOT FOUND this->mInitialTag : %s\n", tag.c_str());
    RaiseParseError(kModuleXml, __LINE__, path, std::string(), "no root element " + tag);
  }
  return root;
}

bool readSectionFromTree(const XmlTree& tree, CDescriptionSection& section,
                         const std::string& path) {
  const int element = isDescriptionDocument(tree) ? descriptionSection(tree, section.name())
                                                  : FindSectionElement(tree, 0, section.name());
  if (element == kNoNode) return false;
  SectionReader(tree, section, path).read(element);
  return true;
}

}  // namespace

void ReadSectionElement(const XmlTree& tree, int node, CDescriptionSection& section,
                        const std::string& path) {
  SectionReader(tree, section, path).read(node);
}

}  // namespace vlr_header_io

using namespace vlr_header_io;

bool readFromXMLFile(CDescriptionSection& section, const char* path) {
  if (path == nullptr || !NVLR_UTILITY_IsRegularFile(path)) return false;
  const XmlTree tree = ParseXmlFile(path);
  return readSectionFromTree(tree, section, path);
}

bool readXmlHeaderFile(CDescriptionHeader& header, const char* path) {
  if (path == nullptr || !NVLR_UTILITY_IsRegularFile(path)) return false;
  const XmlTree tree = ParseXmlFile(path);
  const int root = requireRoot(tree, header.mInitialTag, path);
  for (int i = 0; i < header.sectionCount(); ++i) {
    CDescriptionSection& section = header.section(i);
    const int element = FindSectionElement(tree, root, section.name());
    if (element != kNoNode) ReadSectionElement(tree, element, section, path);
  }
  return true;
}

bool readHeader(CDescriptionHeader& header, const char* fileName, int sectionBySection) {
  std::string name = NVLR_UTILITY_ResolveHeaderName(fileName ? fileName : "");
  NVLR_UTILITY_RemoveSuffix(name, "_hdr");
  NVLR_UTILITY_RemoveSuffix(name, ".sml");
  const std::string xmlPath = name + ".sml";
  const std::string textPath = name + "_hdr";
  const bool isXml = NVLR_UTILITY_IsRegularFile(xmlPath.c_str());
  if (!isXml && !NVLR_UTILITY_IsRegularFile(textPath.c_str())) {
    NVLR_UTILITY_LogPrint("\nFile : %s Not Found\n\n", fileName ? fileName : "");
    return false;
  }
  if (!sectionBySection) {
    return isXml ? readXmlHeaderFile(header, xmlPath.c_str())
                 : readTextHeaderFile(header, textPath.c_str());
  }
  // The file is parsed once; each section is then taken as readFromXMLFile
  // would take it.
  XmlTree tree;
  if (isXml) tree = ParseXmlFile(xmlPath);
  for (int i = 0; i < header.sectionCount(); ++i) {
    CDescriptionSection& section = header.section(i);
    const bool found =
        isXml ? readSectionFromTree(tree, section, xmlPath) : ReadTextSection(section, textPath);
    if (!found) {
      NVLR_UTILITY_TracePrint(" Not Found : %s\n", section.name().c_str());
      NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModuleXml, __LINE__, section.name().c_str());
    }
  }
  return true;
}
