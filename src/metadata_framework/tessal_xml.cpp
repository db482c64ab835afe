#include "metadata_framework/tessal_xml.h"

#include <libxml/parser.h>
#include <libxml/xmlstring.h>
#include <sys/stat.h>

#include <cerrno>
#include <climits>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "runtime/call_scope.h"
#include "runtime/ckerr.h"
#include "runtime/run_outputs.h"

namespace {

constexpr const char* kModule = "tessalxml";
constexpr const char* kRoot = "TessalXmlDoc";
constexpr const char* kChannels = "NumberOfChannels";
constexpr const char* kDescription = "Description";
constexpr const char* kChannel = "Channel";
constexpr const char* kNumber = "Number";
constexpr const char* kVal = "val";
constexpr const char* kIndex = "N";
constexpr const char* kNewDescription = "My description";
// Auxiliary documents are a few kilobytes; anything far larger is not one of
// ours and is not loaded.
constexpr off_t kMaxDocumentBytes = 64L * 1024 * 1024;
constexpr int kParseOptions =
    XML_PARSE_NOBLANKS | XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING;

// The documents held in this thread, innermost first.
thread_local HeldXmlDocument* gHeld = nullptr;

const xmlChar* X(const char* s) {
  return reinterpret_cast<const xmlChar*>(s);
}
const char* C(const xmlChar* s) {
  return reinterpret_cast<const char*>(s);
}

bool isElement(xmlNodePtr n, const char* name) {
  return n->type == XML_ELEMENT_NODE && xmlStrEqual(n->name, X(name));
}

xmlNodePtr firstChild(xmlNodePtr parent, const char* name) {
  for (xmlNodePtr c = parent->children; c != nullptr; c = c->next)
    if (isElement(c, name)) return c;
  return nullptr;
}

// Text of a node (all its text descendants).
std::string textOf(xmlNodePtr n) {
  xmlChar* t = xmlNodeGetContent(n);
  std::string s = t != nullptr ? C(t) : "";
  xmlFree(t);
  return s;
}

void clearChildren(xmlNodePtr n) {
  while (n->children != nullptr) {
    xmlNodePtr c = n->children;
    xmlUnlinkNode(c);
    xmlFreeNode(c);
  }
}

// Replaces the children of a node by one text node holding `text` as is
// (escaped when saved).
void setText(xmlNodePtr n, const char* text) {
  clearChildren(n);
  xmlAddChild(n, xmlNewDocText(n->doc, X(text)));
}

// Value of the index attribute N: 1.. or 0 when absent or not a number.
long indexOf(xmlNodePtr n) {
  xmlChar* v = xmlGetProp(n, X(kIndex));
  if (v == nullptr) return 0;
  char* end = nullptr;
  const int saved = errno;
  long i = std::strtol(C(v), &end, 10);
  errno = saved;
  if (end == C(v) || i < 1) i = 0;
  xmlFree(v);
  return i;
}

bool hasProp(xmlNodePtr n, const char* name, const std::string& value) {
  xmlChar* v = xmlGetProp(n, X(name));
  const bool same = v != nullptr && value == C(v);
  xmlFree(v);
  return same;
}

// Splits a field path at '/', dropping empty parts.
std::vector<std::string> splitPath(const char* path) {
  std::vector<std::string> parts;
  if (path == nullptr) return parts;
  std::string cur;
  for (const char* p = path; *p != '\0'; ++p) {
    if (*p == '/') {
      if (!cur.empty()) parts.push_back(cur);
      cur.clear();
    } else {
      cur += *p;
    }
  }
  if (!cur.empty()) parts.push_back(cur);
  return parts;
}

bool validNames(const std::vector<std::string>& parts) {
  if (parts.empty()) return false;
  for (const std::string& p : parts)
    if (xmlValidateName(X(p.c_str()), 0) != 0) return false;
  return true;
}

// Characters allowed in an XML 1.0 document.
bool allowedInXml(int c) {
  return c == 0x9 || c == 0xA || c == 0xD || (c >= 0x20 && c <= 0xD7FF) ||
         (c >= 0xE000 && c <= 0xFFFD) || (c >= 0x10000 && c <= 0x10FFFF);
}

// Text made safe for an XML 1.0 UTF-8 document: bytes that are not valid
// UTF-8, and characters that XML does not allow, become '?'.  Without this a
// single stray byte from an input product would make the whole document
// unreadable and every other section in it would be lost.
std::string xmlSafe(const char* text) {
  std::string out;
  const size_t n = std::strlen(text);
  out.reserve(n);
  size_t i = 0;
  while (i < n) {
    int len = static_cast<int>(n - i < 4 ? n - i : 4);
    const int c = xmlGetUTF8Char(X(text + i), &len);
    if (c < 0 || len < 1 || !allowedInXml(c)) {
      out += '?';
      ++i;
    } else {
      out.append(text + i, static_cast<size_t>(len));
      i += static_cast<size_t>(len);
    }
  }
  return out;
}

// Decimal conversions with a leading numeric prefix and 0 when there is none.
template <class T>
T parseNumber(const char* s, char** end);

template <>
int parseNumber<int>(const char* s, char** end) {
  long v = std::strtol(s, end, 10);
  if (v > INT_MAX) v = INT_MAX;
  if (v < INT_MIN) v = INT_MIN;
  return static_cast<int>(v);
}
template <>
float parseNumber<float>(const char* s, char** end) {
  return std::strtof(s, end);
}
template <>
double parseNumber<double>(const char* s, char** end) {
  return std::strtod(s, end);
}

void formatNumber(int v, char* buf, size_t size) {
  std::snprintf(buf, size, "%d", v);
}
void formatNumber(float v, char* buf, size_t size) {
  std::snprintf(buf, size, "%.15g", static_cast<double>(v));
}
// "%.15g", the form readers of these documents expect; when 15 digits do not
// give the value back, as many more as it takes.
void formatNumber(double v, char* buf, size_t size) {
  std::snprintf(buf, size, "%.15g", v);
  if (std::isfinite(v) && std::strtod(buf, nullptr) != v) {
    std::snprintf(buf, size, "%.16g", v);
    if (std::strtod(buf, nullptr) != v) std::snprintf(buf, size, "%.17g", v);
  }
}

void silent(void*, const char*, ...) {}

}  // namespace

tessalxml::tessalxml(const char* file) {
  initXmlFile(file);
}

tessalxml::~tessalxml() {
  clean();
}

HeldXmlDocument::HeldXmlDocument(const char* file) {
  doc_.initXmlFile(file);
  outer_ = gHeld;
  gHeld = this;
  holding_ = true;
}

HeldXmlDocument::~HeldXmlDocument() {
  release();
}

void HeldXmlDocument::release() {
  if (!holding_) return;
  holding_ = false;
  // Holds end in reverse order of their start; unlink wherever it stands.
  for (HeldXmlDocument** p = &gHeld; *p != nullptr; p = &(*p)->outer_) {
    if (*p == this) {
      *p = outer_;
      break;
    }
  }
}

int HeldXmlDocument::save() {
  release();
  return doc_.write();
}

void tessalxml::clean() {
  if (doc_ != nullptr && !borrowed_) xmlFreeDoc(doc_);
  doc_ = nullptr;
  borrowed_ = false;
  root_ = nullptr;
  fileName_.clear();
  channels_ = 0;
}

void tessalxml::newDocument() {
  if (doc_ != nullptr && !borrowed_) xmlFreeDoc(doc_);
  borrowed_ = false;
  doc_ = xmlNewDoc(X("1.0"));
  root_ = xmlNewNode(nullptr, X(kRoot));
  xmlDocSetRootElement(doc_, root_);
  xmlNewTextChild(root_, nullptr, X(kChannels), X("0"));
  xmlNewTextChild(root_, nullptr, X(kDescription), X(kNewDescription));
  channels_ = 0;
}

bool tessalxml::recognised(xmlNodePtr root) {
  const char* missing = nullptr;
  if (root == nullptr || !isElement(root, kRoot))
    missing = "/TessalXmlDoc";
  else if (firstChild(root, kChannels) == nullptr)
    missing = "/TessalXmlDoc/NumberOfChannels";
  else if (firstChild(root, kDescription) == nullptr)
    missing = "/TessalXmlDoc/Description";
  if (missing != nullptr && debug_)
    std::fprintf(stderr, "File not recognized: %s does not exist\n", missing);
  return missing == nullptr;
}

int tessalxml::initXmlFile(const char* file) {
  clean();
  fileName_ = file != nullptr ? file : "";
  for (HeldXmlDocument* held = gHeld; held != nullptr; held = held->outer_) {
    if (!fileName_.empty() && held->doc_.fileName_ == fileName_ && held->doc_.doc_ != nullptr) {
      doc_ = held->doc_.doc_;
      root_ = held->doc_.root_;
      channels_ = storedChannels();
      borrowed_ = true;
      return 0;
    }
  }
  const int saved = errno;
  struct stat st;
  const bool present = !fileName_.empty() && ::stat(fileName_.c_str(), &st) == 0 &&
                       S_ISREG(st.st_mode) && st.st_size <= kMaxDocumentBytes;
  xmlDocPtr doc = present ? xmlReadFile(fileName_.c_str(), nullptr, kParseOptions) : nullptr;
  errno = saved;
  // Our documents carry no document type declaration; one that does is not
  // ours, and refusing it keeps entity expansion out of the readers.
  if (doc != nullptr && (doc->intSubset != nullptr || doc->extSubset != nullptr)) {
    xmlFreeDoc(doc);
    doc = nullptr;
  }
  if (doc == nullptr && debug_)
    std::fprintf(stderr, "File not recognized: %s does not exist\n", fileName_.c_str());
  if (doc == nullptr || !recognised(xmlDocGetRootElement(doc))) {
    if (doc != nullptr) xmlFreeDoc(doc);
    newDocument();
    return 1;
  }
  doc_ = doc;
  root_ = xmlDocGetRootElement(doc_);
  channels_ = storedChannels();
  return 0;
}

int tessalxml::setDescription(const char* file, const char* text) {
  if (doc_ == nullptr || file == nullptr || fileName_ != file) initXmlFile(file);
  setText(firstChild(root_, kDescription), xmlSafe(text != nullptr ? text : "").c_str());
  return write();
}

int tessalxml::write() {
  VLR_SCOPE("tessalxml::write", kModule);
  if (borrowed_) return 0;  // the holder saves
  if (doc_ == nullptr) newDocument();
  const int saved = errno;
  // The failure is reported here; the parser library stays quiet.
  xmlGenericErrorFunc handler = xmlGenericError;
  void* context = xmlGenericErrorContext;
  xmlSetGenericErrorFunc(nullptr, silent);
  const int written =
      fileName_.empty() ? -1 : xmlSaveFormatFileEnc(fileName_.c_str(), doc_, "UTF-8", 1);
  xmlSetGenericErrorFunc(context, handler);
  errno = saved;
  if (written < 0) VLR_FAIL("File writing failed!", 5);
  VlrRunOutputBegun(fileName_.c_str());
  return 0;
}

xmlNodePtr tessalxml::findChannel(int channel) const {
  if (root_ == nullptr) return nullptr;
  const std::string number = std::to_string(channel);
  for (xmlNodePtr c = root_->children; c != nullptr; c = c->next)
    if (isElement(c, kChannel) && hasProp(c, kNumber, number)) return c;
  return nullptr;
}

xmlNodePtr tessalxml::channelForWrite(int channel) {
  if (doc_ == nullptr) newDocument();
  xmlNodePtr c = findChannel(channel);
  if (c != nullptr) return c;
  c = xmlNewChild(root_, nullptr, X(kChannel), nullptr);
  xmlNewProp(c, X(kNumber), X(std::to_string(channel).c_str()));
  channels_ = storedChannels();
  if (channels_ < INT_MAX) ++channels_;
  setText(firstChild(root_, kChannels), std::to_string(channels_).c_str());
  return c;
}

int tessalxml::storedChannels() const {
  const int saved = errno;
  const int n = parseNumber<int>(textOf(firstChild(root_, kChannels)).c_str(), nullptr);
  errno = saved;
  return n;
}

xmlNodePtr tessalxml::findField(int channel, const char* path) const {
  xmlNodePtr n = findChannel(channel);
  for (const std::string& part : splitPath(path)) {
    if (n == nullptr) return nullptr;
    n = firstChild(n, part.c_str());
  }
  return n;
}

xmlNodePtr tessalxml::fieldForWrite(int channel, const char* path, xmlNodePtr* parent,
                                    std::string* leaf) {
  const std::vector<std::string> parts = splitPath(path);
  if (!validNames(parts)) return nullptr;
  xmlNodePtr n = channelForWrite(channel);
  for (size_t i = 0; i + 1 < parts.size(); ++i) {
    xmlNodePtr c = firstChild(n, parts[i].c_str());
    n = c != nullptr ? c : xmlNewChild(n, nullptr, X(parts[i].c_str()), nullptr);
  }
  *parent = n;
  *leaf = parts.back();
  return firstChild(n, leaf->c_str());
}

void tessalxml::warnRead(const char* kind, const char* path, int channel) const {
  if (!debug_) return;
  char text[1200];
  std::snprintf(text, sizeof text, "Cannot read %s '%.400s' in channel %d, from XML file %.600s",
                kind, path != nullptr ? path : "", channel, fileName_.c_str());
  are_add_report(text, ARE_WARNING, __LINE__, "tessalxml::read", kModule);
}

template <class T>
int tessalxml::readNumbers(int channel, const char* path, T* values, int count, const char* kind) {
  if (count < 1) return 0;
  xmlNodePtr field = findField(channel, path);
  if (field == nullptr || values == nullptr) {
    warnRead(kind, path, channel);
    return 1;
  }
  const int saved = errno;
  // The `val` children, placed by their index N (or by their order when
  // they carry none).
  std::vector<char> filled(static_cast<size_t>(count), 0);
  int found = 0;
  bool anyVal = false;
  long ordinal = 0;
  for (xmlNodePtr c = field->children; c != nullptr; c = c->next) {
    if (!isElement(c, kVal)) continue;
    anyVal = true;
    ++ordinal;
    long n = xmlHasProp(c, X(kIndex)) != nullptr ? indexOf(c) : ordinal;
    if (n < 1 || n > count || filled[n - 1]) continue;
    values[n - 1] = parseNumber<T>(textOf(c).c_str(), nullptr);
    filled[n - 1] = 1;
    ++found;
  }
  if (!anyVal) {
    const std::string text = textOf(field);
    if (count == 1) {
      values[0] = parseNumber<T>(text.c_str(), nullptr);
      found = 1;
    } else {
      // Older list form: "v1, v2, v3".
      const char* p = text.c_str();
      while (found < count) {
        char* end = nullptr;
        const T v = parseNumber<T>(p, &end);
        if (end == p) break;
        values[found++] = v;
        p = end;
        if (found < count && *p++ != ',') break;
      }
    }
  }
  errno = saved;
  if (found < count) {
    warnRead(kind, path, channel);
    return 1;
  }
  return 0;
}

template <class T>
int tessalxml::writeNumbers(int channel, const char* path, const T* values, int count) {
  if (count < 1) return 0;
  if (values == nullptr) return 1;
  xmlNodePtr parent = nullptr;
  std::string leaf;
  xmlNodePtr field = fieldForWrite(channel, path, &parent, &leaf);
  if (parent == nullptr) return 1;
  if (field == nullptr) field = xmlNewChild(parent, nullptr, X(leaf.c_str()), nullptr);
  char buf[64];
  if (count == 1) {
    formatNumber(values[0], buf, sizeof buf);
    setText(field, buf);
    return 0;
  }
  clearChildren(field);
  for (int i = 0; i < count; ++i) {
    formatNumber(values[i], buf, sizeof buf);
    xmlNodePtr v = xmlNewTextChild(field, nullptr, X(kVal), X(buf));
    xmlNewProp(v, X(kIndex), X(std::to_string(i + 1).c_str()));
  }
  return 0;
}

int tessalxml::readInt(int channel, const char* path, int* values, int count) {
  return readNumbers(channel, path, values, count, "int");
}
int tessalxml::readFloat(int channel, const char* path, float* values, int count) {
  return readNumbers(channel, path, values, count, "float");
}
int tessalxml::readDouble(int channel, const char* path, double* values, int count) {
  return readNumbers(channel, path, values, count, "double");
}
int tessalxml::writeInt(int channel, const char* path, const int* values, int count) {
  return writeNumbers(channel, path, values, count);
}
int tessalxml::writeFloat(int channel, const char* path, const float* values, int count) {
  return writeNumbers(channel, path, values, count);
}
int tessalxml::writeDouble(int channel, const char* path, const double* values, int count) {
  return writeNumbers(channel, path, values, count);
}

namespace {

// Copies text into a buffer of `size` bytes; false when it does not fit.
bool copyText(const std::string& text, char* out, size_t size) {
  if (out == nullptr || text.size() >= size) return false;
  std::memcpy(out, text.c_str(), text.size() + 1);
  return true;
}

}  // namespace

int tessalxml::readString(int channel, const char* path, char* value, size_t size) {
  xmlNodePtr field = findField(channel, path);
  if (field == nullptr || !copyText(textOf(field), value, size)) {
    warnRead("string", path, channel);
    return 1;
  }
  return 0;
}

int tessalxml::readString(int channel, const char* path, char** values, int count, size_t size) {
  if (count < 1) return 0;
  xmlNodePtr field = findField(channel, path);
  if (field == nullptr || values == nullptr) {
    warnRead("string", path, channel);
    return 1;
  }
  std::vector<char> filled(static_cast<size_t>(count), 0);
  int found = 0;
  bool indexed = false;
  bool fits = true;
  for (xmlNodePtr c = field; c != nullptr; c = c->next) {
    if (!isElement(c, C(field->name))) continue;
    const long n = indexOf(c);
    if (n < 1) continue;
    indexed = true;
    if (n > count || filled[n - 1]) continue;
    if (!copyText(textOf(c), values[n - 1], size)) {
      fits = false;
      continue;
    }
    filled[n - 1] = 1;
    ++found;
  }
  if (!indexed) {
    const std::string text = textOf(field);
    if (count == 1) {
      fits = copyText(text, values[0], size);
      found = fits ? 1 : 0;
    } else {
      // Older list form: "a, b, c".
      size_t pos = 0;
      while (found < count && pos <= text.size()) {
        size_t comma = text.find(',', pos);
        if (comma == std::string::npos) comma = text.size();
        size_t b = pos, e = comma;
        while (b < e && std::strchr(" \t\r\n", text[b]) != nullptr) ++b;
        while (e > b && std::strchr(" \t\r\n", text[e - 1]) != nullptr) --e;
        if (b == e && comma == text.size()) break;
        if (!copyText(text.substr(b, e - b), values[found], size)) {
          fits = false;
          break;
        }
        ++found;
        pos = comma + 1;
      }
    }
  }
  if (!fits || found < count) {
    warnRead("string", path, channel);
    return 1;
  }
  return 0;
}

int tessalxml::writeString(int channel, const char* path, const char* value) {
  xmlNodePtr parent = nullptr;
  std::string leaf;
  xmlNodePtr field = fieldForWrite(channel, path, &parent, &leaf);
  if (parent == nullptr) return 1;
  if (field == nullptr) field = xmlNewChild(parent, nullptr, X(leaf.c_str()), nullptr);
  setText(field, xmlSafe(value != nullptr ? value : "").c_str());
  return 0;
}

int tessalxml::writeString(int channel, const char* path, const char* const* values, int count) {
  if (count < 1) return 0;
  if (values == nullptr) return 1;
  xmlNodePtr parent = nullptr;
  std::string leaf;
  fieldForWrite(channel, path, &parent, &leaf);
  if (parent == nullptr) return 1;
  for (int i = 0; i < count; ++i) {
    xmlNodePtr field = nullptr;
    for (xmlNodePtr c = parent->children; c != nullptr && field == nullptr; c = c->next)
      if (isElement(c, leaf.c_str()) && indexOf(c) == i + 1) field = c;
    if (field == nullptr) {
      field = xmlNewChild(parent, nullptr, X(leaf.c_str()), nullptr);
      xmlNewProp(field, X(kIndex), X(std::to_string(i + 1).c_str()));
    }
    setText(field, xmlSafe(values[i] != nullptr ? values[i] : "").c_str());
  }
  return 0;
}

int tessalxml::removeElements(int channel, const char* path) {
  const std::vector<std::string> parts = splitPath(path);
  if (root_ == nullptr || parts.empty()) return 0;
  const std::string number = std::to_string(channel);
  std::vector<xmlNodePtr> level;
  for (xmlNodePtr c = root_->children; c != nullptr; c = c->next)
    if (isElement(c, kChannel) && hasProp(c, kNumber, number)) level.push_back(c);
  for (const std::string& part : parts) {
    std::vector<xmlNodePtr> next;
    for (xmlNodePtr n : level)
      for (xmlNodePtr c = n->children; c != nullptr; c = c->next)
        if (isElement(c, part.c_str())) next.push_back(c);
    level.swap(next);
  }
  for (xmlNodePtr n : level) {
    xmlUnlinkNode(n);
    xmlFreeNode(n);
  }
  return 0;
}
