#include "metadata_framework/general_sar_base.h"

#include <cstdio>

#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "generalSAR_base";

}  // namespace

GeneralSAR_BaseXML::GeneralSAR_BaseXML(const GeneralSAR_BaseXML& other)
    : elements_(other.elements_), allocated_(other.allocated_) {}

GeneralSAR_BaseXML& GeneralSAR_BaseXML::operator=(const GeneralSAR_BaseXML& other) {
  if (this != &other) {
    elements_ = other.elements_;
    cursor_ = 0;
    registeredFor_ = nullptr;
    allocated_ = other.allocated_;
    unsetAuxiliaryFile();
  }
  return *this;
}

GeneralSAR_BaseXML::~GeneralSAR_BaseXML() = default;

int GeneralSAR_BaseXML::createBuffers() {
  return 0;
}
int GeneralSAR_BaseXML::destroyBuffers() {
  return 0;
}

int GeneralSAR_BaseXML::createElementsVector(int n) {
  VLR_SCOPE("createElementsVector", kModule);
  elements_.assign(n > 0 ? static_cast<size_t>(n) : 0, parElement());
  cursor_ = 0;
  registrations_ = 0;
  refreshParameters();
  bool complete = registrations_ == static_cast<int>(elements_.size());
  for (parElement& e : elements_) {
    e.registered = true;
    if (e.type == parElement::PT_NONE) complete = false;
  }
  registeredFor_ = this;
  if (!complete) VLR_FAIL("Registered fields do not match the declared number of fields", 1);
  return 0;
}

void GeneralSAR_BaseXML::destroyElementsVector() {
  elements_.clear();
  cursor_ = 0;
}

void GeneralSAR_BaseXML::ensureRegistered() {
  if (registeredFor_ == this || elements_.empty()) return;
  cursor_ = 0;
  refreshParameters();
  registeredFor_ = this;
}

const parElement& GeneralSAR_BaseXML::element(int i) {
  ensureRegistered();
  return elements_.at(static_cast<size_t>(i));
}

int GeneralSAR_BaseXML::addElement(const char* name, void* ptr, parElement::ParameterType type,
                                   int count, double min, double max, bool mandatory, size_t size,
                                   bool stringArray) {
  if (cursor_ >= static_cast<int>(elements_.size())) return 1;
  parElement& e = elements_[static_cast<size_t>(cursor_)];
  e.setElement(name, ptr, type, count, min, max, mandatory);
  e.stringSize = size;
  e.stringArray = stringArray;
  ++registrations_;
  if (++cursor_ >= static_cast<int>(elements_.size())) cursor_ = 0;
  return 0;
}

int GeneralSAR_BaseXML::addElementInt(const char* name, int* ptr, int count, int min, int max,
                                      bool mandatory) {
  return addElement(name, ptr, parElement::PT_INT, count, min, max, mandatory, 0, false);
}

int GeneralSAR_BaseXML::addElementFloat(const char* name, float* ptr, int count, float min,
                                        float max, bool mandatory) {
  return addElement(name, ptr, parElement::PT_FLOAT, count, min, max, mandatory, 0, false);
}

int GeneralSAR_BaseXML::addElementDouble(const char* name, double* ptr, int count, double min,
                                         double max, bool mandatory) {
  return addElement(name, ptr, parElement::PT_DOUBLE, count, min, max, mandatory, 0, false);
}

int GeneralSAR_BaseXML::addElementString(const char* name, char* ptr, bool mandatory, size_t size) {
  return addElement(name, ptr, parElement::PT_STRING, 1, 0, 0, mandatory, size, false);
}

int GeneralSAR_BaseXML::addElementString(const char* name, char** ptr, int count, bool mandatory,
                                         size_t size) {
  return addElement(name, ptr, parElement::PT_STRING, count, 0, 0, mandatory, size, true);
}

int GeneralSAR_BaseXML::checkCount(const char* field, int n, int maxCount) {
  VLR_SCOPE("checkCount", kModule);
  if (n >= 0 && n <= maxCount) return 0;
  char text[200];
  std::snprintf(text, sizeof text, "Invalid number of elements %d for '%.64s'", n,
                field != nullptr ? field : "");
  VLR_FAIL(text, 1);
}

int GeneralSAR_BaseXML::setAuxiliaryFile(const char* file, int channel, const char* section) {
  file_ = file != nullptr ? file : "";
  section_ = section != nullptr ? section : "";
  xml_.initXmlFile(file_.c_str());
  channel_ = channel;
  return 0;
}

void GeneralSAR_BaseXML::unsetAuxiliaryFile() {
  file_.clear();
  xml_.clean();
  channel_ = 0;
}

std::string GeneralSAR_BaseXML::fieldPath(const parElement& e) const {
  return section_ + "/" + e.name;
}

int GeneralSAR_BaseXML::readElement(parElement& e, int count) {
  const std::string path = fieldPath(e);
  switch (e.type) {
    case parElement::PT_INT:
      return xml_.readInt(channel_, path.c_str(), static_cast<int*>(e.value), count);
    case parElement::PT_FLOAT:
      return xml_.readFloat(channel_, path.c_str(), static_cast<float*>(e.value), count);
    case parElement::PT_DOUBLE:
      return xml_.readDouble(channel_, path.c_str(), static_cast<double*>(e.value), count);
    case parElement::PT_STRING:
      if (e.stringArray)
        return xml_.readString(channel_, path.c_str(), static_cast<char**>(e.value), count,
                               e.stringSize);
      return xml_.readString(channel_, path.c_str(), static_cast<char*>(e.value), e.stringSize);
    case parElement::PT_NONE:
      break;
  }
  return 1;
}

int GeneralSAR_BaseXML::writeElement(const parElement& e) {
  const std::string path = fieldPath(e);
  switch (e.type) {
    case parElement::PT_INT:
      return xml_.writeInt(channel_, path.c_str(), static_cast<const int*>(e.value), e.count);
    case parElement::PT_FLOAT:
      return xml_.writeFloat(channel_, path.c_str(), static_cast<const float*>(e.value), e.count);
    case parElement::PT_DOUBLE:
      return xml_.writeDouble(channel_, path.c_str(), static_cast<const double*>(e.value), e.count);
    case parElement::PT_STRING:
      if (e.stringArray)
        return xml_.writeString(channel_, path.c_str(), static_cast<const char* const*>(e.value),
                                e.count);
      return xml_.writeString(channel_, path.c_str(), static_cast<const char*>(e.value));
    case parElement::PT_NONE:
      break;
  }
  return 1;
}

int GeneralSAR_BaseXML::readAuxiliaryFile() {
  VLR_SCOPE("readAuxiliaryFile", kModule);
  ensureRegistered();
  // First pass: the numeric scalars, which give the sizes of the buffers.
  for (parElement& e : elements_) {
    if (!e.scalar || !e.isNumeric() || e.value == nullptr) continue;
    if (readElement(e, 1) != 0 && e.mandatory) return 1;
  }
  VLR_CALL(createBuffers());
  if (!allocated_) return 1;
  // Second pass: every stored field.
  for (parElement& e : elements_) {
    if (e.count < 1) continue;
    const int rc = e.value != nullptr ? readElement(e, e.count) : 1;
    if (rc != 0 && e.mandatory) return 1;
  }
  return 0;
}

int GeneralSAR_BaseXML::writeAuxiliaryFile() {
  VLR_SCOPE("writeAuxiliaryFile", kModule);
  ensureRegistered();
  cleanAuxiliaryFile();
  if (!allocated_) return 1;
  for (const parElement& e : elements_) {
    if (e.count < 1) continue;
    if (e.value == nullptr || writeElement(e) != 0) {
      char text[200];
      std::snprintf(text, sizeof text, "Field '%.64s' cannot be stored", e.name.c_str());
      VLR_FAIL(text, 1);
    }
  }
  VLR_CALL(xml_.write());
  return 0;
}

bool GeneralSAR_BaseXML::readAuxiliaryFile(const char* file, int channel, const char* section) {
  setAuxiliaryFile(file, channel, section);
  const int rc = readAuxiliaryFile();
  unsetAuxiliaryFile();
  return rc == 0;
}

int GeneralSAR_BaseXML::writeAuxiliaryFile(const char* file, int channel, const char* section) {
  setAuxiliaryFile(file, channel, section);
  const int rc = writeAuxiliaryFile();
  unsetAuxiliaryFile();
  return rc;
}

int GeneralSAR_BaseXML::cleanAuxiliaryFile() {
  return xml_.removeElements(channel_, section_.c_str());
}

bool GeneralSAR_BaseXML::getConfigurationFile(const char* file, int channel, const char* section,
                                              char* out, size_t size) {
  setAuxiliaryFile(file, channel, section);
  const std::string path = section_ + "/ConfigurationFile";
  const int rc = xml_.readString(channel_, path.c_str(), out, size);
  unsetAuxiliaryFile();
  return rc == 0;
}

int GeneralSAR_Base::writehdr() {
  return 0;
}
int GeneralSAR_Base::writehdr(const char*) {
  return 0;
}
int GeneralSAR_Base::readhdr(const char*) {
  return 0;
}
