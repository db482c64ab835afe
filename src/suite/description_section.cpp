// Header sections and their definition from section key files.
//
// A key file "<Section>.key" in the key-file folder holds blocks; a line
// whose '[' is its first or second character opens the block named by its
// first token.  In the block of the section each line holding '=' defines a
// field:
//   Name = TYPE                        TYPE: I, D, F or S for a Scalar, V? for
//                                      a Vector, M? for a Matrix (? = I, D, F, S)
//   Name = n (Sub1 = TYPE, Sub2 = TYPE)  a Multiple field of n sub-fields
#include "suite/description_section.h"

#include <cstdio>
#include <cstring>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_handle.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "vlr_description_section";

[[noreturn]] void keyFileError(const std::string& text, int line) {
  NVLR_UTILITY_RaiseError(vlr::kCodeFieldType, kModule, line, text.substr(0, 144).c_str());
}

// Splits text at any of the separators, dropping empty tokens.
std::vector<std::string> tokens(const std::string& text, const char* separators) {
  std::vector<std::string> out;
  size_t i = 0;
  while (i < text.size()) {
    const size_t start = text.find_first_not_of(separators, i);
    if (start == std::string::npos) break;
    size_t end = text.find_first_of(separators, start);
    if (end == std::string::npos) end = text.size();
    out.push_back(text.substr(start, end - start));
    i = end;
  }
  return out;
}

// The first token of text and the position just after it.
std::string firstToken(const std::string& text, const char* separators, size_t& after) {
  const size_t start = text.find_first_not_of(separators);
  if (start == std::string::npos) {
    after = text.size();
    return std::string();
  }
  size_t end = text.find_first_of(separators, start);
  if (end == std::string::npos) end = text.size();
  after = end;
  return text.substr(start, end - start);
}

bool typeLetter(char letter, CVLR_FieldType& type) {
  switch (letter) {
    case 'I':
      type = CVLR_FieldType::Integer;
      return true;
    case 'D':
    case 'F':
      type = CVLR_FieldType::Double;
      return true;
    case 'S':
      type = CVLR_FieldType::String;
      return true;
    default:
      return false;
  }
}

// A field from its name and type word ("VD", "MI", "F", ...).
CDescriptionField fieldFromTypeWord(const std::string& name, const std::string& word) {
  CVLR_FieldShape shape = CVLR_FieldShape::Scalar;
  size_t letter = 0;
  if (!word.empty() && (word[0] == 'M' || word[0] == 'V')) {
    shape = word[0] == 'M' ? CVLR_FieldShape::Matrix : CVLR_FieldShape::Vector;
    letter = 1;
  }
  CVLR_FieldType type;
  if (word.size() <= letter || !typeLetter(word[letter], type)) {
    NVLR_UTILITY_TracePrint("\nWrong type word [%.40s] of the field %.80s\n", word.c_str(),
                            name.c_str());
    keyFileError(name, __LINE__);
  }
  return CDescriptionField(name, shape, type);
}

// A positive decimal count, or 0 when the word is not one.
long long positiveCount(const std::string& word) {
  if (word.empty() || word.size() > 9) return 0;
  for (char c : word)
    if (c < '0' || c > '9') return 0;
  return std::atoll(word.c_str());
}

// Reads one line of at most CVLR_DS_MAX_KEY_LINE characters; false at the end.
bool readKeyLine(FILE* f, const std::string& path, std::string& line) {
  line.clear();
  int c;
  while ((c = std::fgetc(f)) != EOF && c != '\n') {
    if (line.size() >= static_cast<size_t>(CVLR_DS_MAX_KEY_LINE)) {
      NVLR_UTILITY_TracePrint("\nKey file line longer than %d characters : %s\n",
                              CVLR_DS_MAX_KEY_LINE, path.c_str());
      keyFileError("key file line too long: " + path, __LINE__);
    }
    line.push_back(static_cast<char>(c));
  }
  if (!line.empty() && line.back() == '\r') line.pop_back();
  return c != EOF || !line.empty();
}

}  // namespace

CDescriptionSection::CDescriptionSection(const std::string& name) : mName(name) {
  if (name.empty() || name.size() > static_cast<size_t>(CVLR_DS_MAX_NAME_LEN)) {
    NVLR_UTILITY_TracePrint("\nSection name empty or longer than %d characters : %.80s\n",
                            CVLR_DS_MAX_NAME_LEN, name.c_str());
    keyFileError(name.empty() ? "Not initialised" : name.substr(0, 80), __LINE__);
  }
}

CDescriptionField* CDescriptionSection::findField(const std::string& name) {
  const auto it = mIndex.find(name);
  return it == mIndex.end() ? nullptr : &mFields[it->second];
}

const CDescriptionField* CDescriptionSection::findField(const std::string& name) const {
  const auto it = mIndex.find(name);
  return it == mIndex.end() ? nullptr : &mFields[it->second];
}

CDescriptionField* CDescriptionSection::addField(const CDescriptionField& field) {
  if (mFields.size() >= static_cast<size_t>(CVLR_DS_MAX_NBR_FIELDS)) {
    NVLR_UTILITY_TracePrint("\nECEEDED : %d fields in section %s\n", CVLR_DS_MAX_NBR_FIELDS,
                            mName.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeKeyFileMissing, kModule, __LINE__, "All pools are busy");
  }
  if (mIndex.count(field.name()) != 0) {
    NVLR_UTILITY_TracePrint("\nField %s defined twice in section %s\n", field.label(),
                            mName.c_str());
    keyFileError(field.name(), __LINE__);
  }
  mIndex.emplace(field.name(), mFields.size());
  mFields.push_back(field);
  return &mFields.back();
}

void CDescriptionSection::defineFromKeyFile() {
  defineFromKeyFile(NVLR_UTILITY_EnvValue("VELORAN_KEY_FILES_DIR") + mName + ".key");
}

void CDescriptionSection::defineFromKeyFile(const std::string& keyFilePath) {
  // Closed on every path, raises included (they throw in tests).
  const FileHandle file(keyFilePath.c_str(), "r");
  FILE* f = file.get();
  if (f == nullptr) {
    NVLR_UTILITY_TracePrint("\nError: missing key file %s\n", keyFilePath.c_str());
    const std::string extra = "Error: missing key file " + keyFilePath;
    NVLR_UTILITY_RaiseError(vlr::kCodeKeyFileMissing, kModule, __LINE__, extra.c_str());
  }
  std::string line;
  bool inBlock = false;
  while (readKeyLine(f, keyFilePath, line)) {
    if (!line.empty() && (line[0] == '[' || (line.size() > 1 && line[1] == '['))) {
      if (inBlock) break;
      size_t after = 0;
      inBlock = firstToken(line, "\t [] ", after) == mName;
      continue;
    }
    if (!inBlock || line.find('=') == std::string::npos) continue;
    size_t afterName = 0;
    const std::string name = firstToken(line, "\t =", afterName);
    size_t afterWord = 0;
    const std::string rest = line.substr(afterName);
    const std::string word = firstToken(rest, "\t =(", afterWord);
    const long long count = positiveCount(word);
    if (count == 0) {
      addField(fieldFromTypeWord(name, word));
      continue;
    }
    if (count > CVLR_DS_MAX_NBR_FIELDS) {
      NVLR_UTILITY_TracePrint("\nECEEDED : %lld sub-fields of %s\n", count, name.c_str());
      NVLR_UTILITY_RaiseError(vlr::kCodeKeyFileMissing, kModule, __LINE__, "All pools are busy");
    }
    const std::vector<std::string> parts = tokens(rest.substr(afterWord), " \t=(),");
    if (parts.size() < static_cast<size_t>(2 * count)) {
      NVLR_UTILITY_TracePrint("\nMultiple field %s defines fewer than %lld sub-fields\n",
                              name.c_str(), count);
      keyFileError(name, __LINE__);
    }
    CDescriptionField multiple(name, CVLR_FieldShape::Multiple, CVLR_FieldType::FieldOfSection);
    for (long long k = 0; k < count; ++k)
      multiple.addSubField(fieldFromTypeWord(parts[2 * k], parts[2 * k + 1]));
    addField(multiple);
  }
}

bool CDescriptionSection::isSet() const {
  for (const auto& field : mFields)
    if (field.isSet()) return true;
  return false;
}

void CDescriptionSection::clear() {
  for (auto& field : mFields) field.clear();
}

std::string CDescriptionSection::dumpText() const {
  char head[160];
  std::snprintf(head, sizeof head, "\n\n << [%s]  -  Total number of Fields : %d >>\n\n",
                mName.c_str(), fieldCount());
  std::string text = head;
  for (const auto& field : mFields) text += field.dumpText() + "\n";
  return text;
}
