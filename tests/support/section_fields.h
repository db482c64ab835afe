// Generic helpers over the field descriptors of a section: fill every field
// with distinct values, compare two sections field by field, and write the
// parameter-file form of a section.
#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <map>
#include <set>
#include <string>

#include "metadata_framework/general_sar_base.h"

namespace section_test {

// Value k of a field as the parameter-file text, with every digit needed to
// restore it exactly.
inline std::string valueText(const parElement& e, int k) {
  char item[600] = "";
  switch (e.type) {
    case parElement::PT_INT:
      std::snprintf(item, sizeof item, "%d", static_cast<int*>(e.value)[k]);
      break;
    case parElement::PT_FLOAT:
      std::snprintf(item, sizeof item, "%.9g", static_cast<float*>(e.value)[k]);
      break;
    case parElement::PT_DOUBLE:
      std::snprintf(item, sizeof item, "%.17g", static_cast<double*>(e.value)[k]);
      break;
    case parElement::PT_STRING:
      std::snprintf(item, sizeof item, "%s", static_cast<char*>(e.value));
      break;
    case parElement::PT_NONE:
      break;
  }
  return item;
}

// Field i gets values derived from i and `seed`, so that two fills with
// different seeds differ everywhere.
inline void fill(GeneralSAR_BaseXML& s, int seed) {
  for (int i = 0; i < s.elementCount(); ++i) {
    const parElement& e = s.element(i);
    for (int k = 0; k < e.count; ++k) {
      const int v = seed * 100 + i * 10 + k + 1;
      if (e.type == parElement::PT_INT) static_cast<int*>(e.value)[k] = v;
      if (e.type == parElement::PT_FLOAT) static_cast<float*>(e.value)[k] = v * 0.5f;
      if (e.type == parElement::PT_DOUBLE) static_cast<double*>(e.value)[k] = v * 1.25 + 1e-9;
      if (e.type == parElement::PT_STRING)
        std::snprintf(static_cast<char*>(e.value), e.stringSize, "text %d", v);
    }
  }
}

inline void expectSameFields(GeneralSAR_BaseXML& a, GeneralSAR_BaseXML& b) {
  ASSERT_EQ(a.elementCount(), b.elementCount());
  for (int i = 0; i < a.elementCount(); ++i) {
    const parElement& x = a.element(i);
    const parElement& y = b.element(i);
    ASSERT_EQ(x.name, y.name);
    ASSERT_EQ(x.count, y.count) << x.name;
    for (int k = 0; k < x.count; ++k) EXPECT_EQ(valueText(x, k), valueText(y, k)) << x.name;
  }
}

// "[section]" and one record per field; `keys` renames fields, fields named
// in `skip` are left out.
inline std::string legacyText(GeneralSAR_BaseXML& s, const std::string& section,
                              const std::map<std::string, std::string>& keys = {},
                              const std::set<std::string>& skip = {}) {
  std::string text = "[" + section + "]\n";
  for (int i = 0; i < s.elementCount(); ++i) {
    const parElement& e = s.element(i);
    if (e.count < 1 || skip.count(e.name) != 0) continue;
    const auto renamed = keys.find(e.name);
    std::string value;
    for (int k = 0; k < e.count; ++k) value += (k ? " " : "") + valueText(e, k);
    if (e.count > 1) value = "{" + value + "}";
    text += (renamed != keys.end() ? renamed->second : e.name) + " = " + value + "\n";
  }
  return text;
}

}  // namespace section_test
