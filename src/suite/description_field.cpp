// Typed fields of suite header sections.
#include "suite/description_field.h"

#include <cmath>
#include <cstdio>

#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "suite/description_io.h"
#include "suite/number_text.h"

namespace {

constexpr const char* kModule = "vlr_description_section";
const std::string kEmptyString;

const char* shapeWord(CVLR_FieldShape shape) {
  switch (shape) {
    case CVLR_FieldShape::Scalar:
      return "SCALAR";
    case CVLR_FieldShape::Vector:
      return "VECTOR";
    case CVLR_FieldShape::Matrix:
      return "MARTIX";
    case CVLR_FieldShape::Multiple:
      return "MULTIPLE";
  }
  return "WRONG";
}

// The dump's type word: the element word of the type, spelled out for the
// structures of a Multiple field.
const char* typeWord(CVLR_FieldType type) {
  return type == CVLR_FieldType::FieldOfSection ? "Field Of Section pointer"
                                                : vlr_header_io::ElementTypeWord(type);
}

[[noreturn]] void fieldError(const char* label, int line) {
  NVLR_UTILITY_RaiseError(vlr::kCodeFieldType, kModule, line, label);
}

}  // namespace

CDescriptionField::CDescriptionField(const std::string& name, CVLR_FieldShape shape,
                                     CVLR_FieldType type)
    : mName(name), mShape(shape), mType(type) {
  if (name.empty() || name.size() > static_cast<size_t>(CVLR_DS_MAX_NAME_LEN)) {
    NVLR_UTILITY_TracePrint("\nField name empty or longer than %d characters : %.80s\n",
                            CVLR_DS_MAX_NAME_LEN, name.c_str());
    fieldError(name.empty() ? "Not initialised" : name.substr(0, 80).c_str(), __LINE__);
  }
  if (shape == CVLR_FieldShape::Multiple) {
    mType = CVLR_FieldType::FieldOfSection;
    mRowNbr = 1;
    mColNbr = 0;
  } else {
    if (type == CVLR_FieldType::FieldOfSection) fieldError(label(), __LINE__);
    resize(1, 1);
  }
}

const char* CDescriptionField::label() const {
  return mName.empty() ? "Not initialised" : mName.c_str();
}

void CDescriptionField::addSubField(const CDescriptionField& field) {
  if (mShape != CVLR_FieldShape::Multiple) typeError();
  mSubFields.push_back(field);
  mColNbr = static_cast<int>(mSubFields.size());
}

bool CDescriptionField::isSet() const {
  if (mShape == CVLR_FieldShape::Multiple) return !mSubFields.empty() && mSubFields.front().isSet();
  return !mSet.empty() && mSet.front() != 0;
}

bool CDescriptionField::isSetAt(int row, int column) const {
  if (mShape == CVLR_FieldShape::Multiple || row < 0 || column < 0 || row >= mRowNbr ||
      column >= mColNbr)
    return false;
  return mSet[static_cast<size_t>(row) * static_cast<size_t>(mColNbr) + column] != 0;
}

void CDescriptionField::typeError() const {
  NVLR_UTILITY_TracePrint("\n%s\n", dumpText().c_str());
  fieldError(label(), __LINE__);
}

size_t CDescriptionField::index(int row, int column, CVLR_FieldType wanted) const {
  if (mType != wanted || mShape == CVLR_FieldShape::Multiple) typeError();
  if (row < 0 || column < 0 || row >= mRowNbr || column >= mColNbr) {
    NVLR_UTILITY_TracePrint("\nElement (%d, %d) outside the %d x %d field %s\n", row, column,
                            mRowNbr, mColNbr, label());
    typeError();
  }
  return static_cast<size_t>(row) * static_cast<size_t>(mColNbr) + static_cast<size_t>(column);
}

int CDescriptionField::getIntegerAt(int row, int column) const {
  return mIntegers[index(row, column, CVLR_FieldType::Integer)];
}

double CDescriptionField::getDoubleAt(int row, int column) const {
  return mDoubles[index(row, column, CVLR_FieldType::Double)];
}

const std::string& CDescriptionField::getStringAt(int row, int column) const {
  return mStrings[index(row, column, CVLR_FieldType::String)];
}

void CDescriptionField::setIntegerAt(int row, int column, int value) {
  const size_t i = index(row, column, CVLR_FieldType::Integer);
  mIntegers[i] = value;
  mSet[i] = 1;
}

void CDescriptionField::setDoubleAt(int row, int column, double value) {
  const size_t i = index(row, column, CVLR_FieldType::Double);
  mDoubles[i] = value;
  mSet[i] = 1;
}

void CDescriptionField::setStringAt(int row, int column, const std::string& value) {
  const size_t i = index(row, column, CVLR_FieldType::String);
  mStrings[i] = value;
  mSet[i] = 1;
}

namespace {

// Moves the elements of a rows x columns array into a new shape, keeping each
// element at its (row, column) place.
template <typename T>
void reshape(std::vector<T>& values, int oldRows, int oldColumns, int rows, int columns,
             const T& empty) {
  std::vector<T> next(static_cast<size_t>(rows) * static_cast<size_t>(columns), empty);
  const int keepRows = std::min(oldRows, rows);
  const int keepColumns = std::min(oldColumns, columns);
  if (!values.empty()) {
    for (int r = 0; r < keepRows; ++r)
      for (int c = 0; c < keepColumns; ++c)
        next[static_cast<size_t>(r) * columns + c] =
            std::move(values[static_cast<size_t>(r) * oldColumns + c]);
  }
  values.swap(next);
}

}  // namespace

void CDescriptionField::resize(int rows, int columns) {
  if (mShape == CVLR_FieldShape::Multiple || rows < 0 || columns < 0 ||
      static_cast<long long>(rows) * columns > CVLR_DS_MAX_ELEMENTS) {
    NVLR_UTILITY_TracePrint("\nCannot size the field %s to %d x %d\n", label(), rows, columns);
    fieldError(label(), __LINE__);
  }
  const int oldRows = mSet.empty() ? 0 : mRowNbr;
  const int oldColumns = mSet.empty() ? 0 : mColNbr;
  reshape<char>(mSet, oldRows, oldColumns, rows, columns, 0);
  switch (mType) {
    case CVLR_FieldType::Integer:
      reshape<int>(mIntegers, oldRows, oldColumns, rows, columns, 0);
      break;
    case CVLR_FieldType::Double:
      reshape<double>(mDoubles, oldRows, oldColumns, rows, columns, 0.0);
      break;
    case CVLR_FieldType::String:
      reshape<std::string>(mStrings, oldRows, oldColumns, rows, columns, std::string());
      break;
    case CVLR_FieldType::FieldOfSection:
      break;
  }
  mRowNbr = rows;
  mColNbr = columns;
}

void CDescriptionField::setNumberOfElements(int n) {
  if (mShape != CVLR_FieldShape::Multiple) {
    resize(1, n);
    return;
  }
  for (const auto& sub : mSubFields)
    if (sub.shape() != CVLR_FieldShape::Vector) fieldError(label(), __LINE__);
  for (auto& sub : mSubFields) sub.resize(1, n);
}

void CDescriptionField::copyFrom(const CDescriptionField& source) {
  if (&source == this) return;
  const bool multiple = mShape == CVLR_FieldShape::Multiple;
  const bool sourceMultiple = source.mShape == CVLR_FieldShape::Multiple;
  if (source.mType != mType || multiple != sourceMultiple) fieldError(label(), __LINE__);
  if (multiple) {
    // Structures are copied sub-field by sub-field; both sides must define the
    // same number of sub-fields.
    if (mSubFields.size() != source.mSubFields.size()) fieldError(label(), __LINE__);
    for (size_t i = 0; i < mSubFields.size(); ++i) mSubFields[i].copyFrom(source.mSubFields[i]);
    return;
  }
  resize(source.mRowNbr, source.mColNbr);
  mSet = source.mSet;
  mIntegers = source.mIntegers;
  mDoubles = source.mDoubles;
  mStrings = source.mStrings;
}

void CDescriptionField::clear() {
  std::fill(mSet.begin(), mSet.end(), 0);
  for (auto& sub : mSubFields) sub.clear();
}

std::string CDescriptionField::dumpText() const {
  std::string text =
      "[" + std::string(label()) + "]  [" + shapeWord(mShape) + "]  [" + typeWord(mType) + "]";
  char sizes[96];
  switch (mShape) {
    case CVLR_FieldShape::Scalar:
      sizes[0] = '\0';
      break;
    case CVLR_FieldShape::Vector:
      std::snprintf(sizes, sizeof sizes, "  [Number of elements : %d]", mColNbr);
      break;
    case CVLR_FieldShape::Matrix:
      std::snprintf(sizes, sizeof sizes, "  [Row Nbr : %d]  [Col Nbr : %d]", mRowNbr, mColNbr);
      break;
    case CVLR_FieldShape::Multiple:
      std::snprintf(sizes, sizeof sizes, "  [Number of sub fiels : %d]", mColNbr);
      break;
  }
  text += sizes;
  if (mShape == CVLR_FieldShape::Multiple) {
    for (const auto& sub : mSubFields) text += "\n      " + sub.dumpText();
    return text;
  }
  if (!isSet()) return text + " : EMPTY";
  switch (mType) {
    case CVLR_FieldType::Integer:
      return text + "  =  " + std::to_string(mIntegers.front());
    case CVLR_FieldType::Double:
      return text + "  =  " + NVLR_UTILITY_DoubleText(mDoubles.front());
    case CVLR_FieldType::String:
      return text + "  =  [" + mStrings.front() + "]";
    default:
      return text + " : ERROR";
  }
}

int getInteger(const CDescriptionField* field) {
  return field->getIntegerAt(0, 0);
}
int getInteger(const CDescriptionField* field, int index) {
  return field->getIntegerAt(0, index);
}
double getDouble(const CDescriptionField* field) {
  return field->getDoubleAt(0, 0);
}
double getDouble(const CDescriptionField* field, int index) {
  return field->getDoubleAt(0, index);
}
std::string getString(const CDescriptionField* field) {
  return field->getStringAt(0, 0);
}
std::string getString(const CDescriptionField* field, int index) {
  return field->getStringAt(0, index);
}
int getIntegerAt(const CDescriptionField* field, int row, int column) {
  return field->getIntegerAt(row, column);
}
double getDoubleAt(const CDescriptionField* field, int row, int column) {
  return field->getDoubleAt(row, column);
}
std::string getStringAt(const CDescriptionField* field, int row, int column) {
  return field->getStringAt(row, column);
}
void setInteger(CDescriptionField* field, int value) {
  field->setIntegerAt(0, 0, value);
}
void setInteger(CDescriptionField* field, int index, int value) {
  field->setIntegerAt(0, index, value);
}
void setDouble(CDescriptionField* field, double value) {
  field->setDoubleAt(0, 0, value);
}
void setDouble(CDescriptionField* field, int index, double value) {
  field->setDoubleAt(0, index, value);
}
void setString(CDescriptionField* field, const std::string& value) {
  field->setStringAt(0, 0, value);
}
void setString(CDescriptionField* field, int index, const std::string& value) {
  field->setStringAt(0, index, value);
}
void setIntegerAt(CDescriptionField* field, int row, int column, int value) {
  field->setIntegerAt(row, column, value);
}
void setDoubleAt(CDescriptionField* field, int row, int column, double value) {
  field->setDoubleAt(row, column, value);
}
void setStringAt(CDescriptionField* field, int row, int column, const std::string& value) {
  field->setStringAt(row, column, value);
}
void resize(CDescriptionField* field, int rows, int columns) {
  field->resize(rows, columns);
}
void setNumberOfElements(CDescriptionField* field, int n) {
  field->setNumberOfElements(n);
}
void copyField(CDescriptionField* target, const CDescriptionField* source) {
  target->copyFrom(*source);
}
bool isSet(const CDescriptionField* field) {
  return field->isSet();
}
