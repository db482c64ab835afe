// A named section of a suite header: its fields in definition order.
#pragma once

#include <deque>
#include <string>
#include <unordered_map>

#include "suite/description_field.h"

// Most fields one section may define; a key file with more is refused with
// 848640 ("All pools are busy").
constexpr int CVLR_DS_MAX_NBR_FIELDS = 4096;
// Longest key-file line, in characters.
constexpr int CVLR_DS_MAX_KEY_LINE = 4096;

class CDescriptionSection {
 public:
  // Raises 848644 when the name is empty or too long.
  explicit CDescriptionSection(const std::string& name);

  const std::string& name() const { return mName; }
  int fieldCount() const { return static_cast<int>(mFields.size()); }
  CDescriptionField& field(int i) { return mFields[static_cast<size_t>(i)]; }
  const CDescriptionField& field(int i) const { return mFields[static_cast<size_t>(i)]; }
  // Null when the section has no field of that name.
  CDescriptionField* findField(const std::string& name);
  const CDescriptionField* findField(const std::string& name) const;

  // Appends a field definition; a name the section already has raises 848644,
  // and 848640 ("All pools are busy") beyond
  // CVLR_DS_MAX_NBR_FIELDS.  Returns the stored field.
  CDescriptionField* addField(const CDescriptionField& field);

  // Defines the fields from "<dir><name>.key" (dir from VELORAN_KEY_FILES_DIR).
  // A missing file raises 848640 "Error: missing key file "; a wrong type word
  // or an over-long name or line raises 848644.
  void defineFromKeyFile();
  // The same from a given key file (used by the above and by tests).
  void defineFromKeyFile(const std::string& keyFilePath);

  // True when any of its fields is set.
  bool isSet() const;
  // Marks every field unset.
  void clear();

  // Trace dump: "\n\n << [name]  -  Total number of Fields : n >>\n\n" and the fields.
  std::string dumpText() const;

 private:
  std::string mName;
  // A deque keeps the fields in place as more are added, so pointers that
  // findField and addField return stay valid.
  std::deque<CDescriptionField> mFields;
  std::unordered_map<std::string, size_t> mIndex;
};
