#include "metadata_sections/legacy_fields.h"

#include <cstring>

#include "profile/profile_cache.h"
#include "profile/profile_values.h"

namespace {

// 0 when the key gave every value of the field.
int readField(const parElement& e, const char* file, const char* section, const char* key) {
  switch (e.type) {
    case parElement::PT_INT:
      return GetMyProfileIntArray(section, key, static_cast<int*>(e.value), e.count, file);
    case parElement::PT_FLOAT:
      return GetMyProfileFloatArray(section, key, static_cast<float*>(e.value), e.count, file);
    case parElement::PT_DOUBLE:
      return GetProfileDoubleArray(section, key, static_cast<double*>(e.value), e.count, file);
    case parElement::PT_STRING: {
      // A text that does not fit the field is refused rather than cut.
      const char* text = GetSetProfileChar(kProfileGet, section, key, nullptr, file);
      if (e.stringArray || text == nullptr || std::strlen(text) >= e.stringSize) return 1;
      std::memcpy(e.value, text, std::strlen(text) + 1);
      return 0;
    }
    case parElement::PT_NONE:
      break;
  }
  return 1;
}

}  // namespace

int readLegacyFields(GeneralSAR_BaseXML& section, const char* file, const char* sectionName,
                     const char* const* keys) {
  int rc = 0;
  for (int i = 0; i < section.elementCount(); ++i) {
    const parElement& e = section.element(i);
    const char* key = keys != nullptr ? keys[i] : e.name.c_str();
    if (key == nullptr || e.count < 1 || e.value == nullptr) continue;
    if (readField(e, file, sectionName, key) != 0 && e.mandatory) rc = 1;
  }
  return rc;
}
