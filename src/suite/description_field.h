// One typed field of a suite header section.
//
// A field is a rows x columns array of one data type with a "set" flag per
// element.  A Scalar is 1 x 1, a Vector 1 x n (the element index is the
// column), a Matrix rows x columns, and a Multiple (a vector of structures)
// holds mColNbr sub-fields, each a Vector of the structure's elements.
#pragma once

#include <string>
#include <vector>

enum class CVLR_FieldShape { Scalar = 0, Vector = 1, Matrix = 2, Multiple = 3 };
enum class CVLR_FieldType { Integer = 0, Double = 1, String = 2, FieldOfSection = 3 };

// Longest field or section name, in characters.
constexpr int CVLR_DS_MAX_NAME_LEN = 63;
// Largest number of elements one field may hold (rows x columns); a header
// that asks for more is refused instead of allocating without bound.
constexpr long long CVLR_DS_MAX_ELEMENTS = 16 * 1024 * 1024;

class CDescriptionField {
 public:
  CDescriptionField() = default;
  // Raises 848644 when the name is empty or longer than CVLR_DS_MAX_NAME_LEN.
  CDescriptionField(const std::string& name, CVLR_FieldShape shape, CVLR_FieldType type);

  const std::string& name() const { return mName; }
  // The name for messages: "Not initialised" for a field without name.
  const char* label() const;
  CVLR_FieldShape shape() const { return mShape; }
  CVLR_FieldType type() const { return mType; }
  int rows() const { return mRowNbr; }
  int columns() const { return mColNbr; }

  // Sub-fields of a Multiple field (empty otherwise).
  std::vector<CDescriptionField>& subFields() { return mSubFields; }
  const std::vector<CDescriptionField>& subFields() const { return mSubFields; }
  // Adds a sub-field to a Multiple field and counts it in mColNbr.
  void addSubField(const CDescriptionField& field);

  // Set when the first element has been written (a Multiple: its first
  // sub-field's first element).
  bool isSet() const;
  bool isSetAt(int row, int column) const;

  // Typed element access; a wrong data type raises 848644, an element
  // outside rows x columns raises 848644.  An unset element reads as 0,
  // 0.0 or "".
  int getIntegerAt(int row, int column) const;
  double getDoubleAt(int row, int column) const;
  const std::string& getStringAt(int row, int column) const;
  void setIntegerAt(int row, int column, int value);
  void setDoubleAt(int row, int column, double value);
  void setStringAt(int row, int column, const std::string& value);

  // New size; kept elements stay, new ones are unset.  Negative sizes or more
  // than CVLR_DS_MAX_ELEMENTS raise 848644.
  void resize(int rows, int columns);
  // resize(1, n); a Multiple resizes each sub-field, which must be Vectors.
  void setNumberOfElements(int n);
  // Takes the values of another field of the same data type (848644 else).
  void copyFrom(const CDescriptionField& source);
  // Marks every element unset.
  void clear();

  // The trace dump of the field: "[name]  [SHAPE]  [Type]", sizes, value.
  std::string dumpText() const;

 private:
  size_t index(int row, int column, CVLR_FieldType wanted) const;
  [[noreturn]] void typeError() const;

  std::string mName;
  CVLR_FieldShape mShape = CVLR_FieldShape::Scalar;
  CVLR_FieldType mType = CVLR_FieldType::Integer;
  int mRowNbr = 1;
  int mColNbr = 1;
  std::vector<int> mIntegers;
  std::vector<double> mDoubles;
  std::vector<std::string> mStrings;
  std::vector<char> mSet;
  std::vector<CDescriptionField> mSubFields;
};

// The suite library's free-function access, as callers use it.  The forms
// without index address element (0, 0), those with an index (0, index).
int getInteger(const CDescriptionField* field);
int getInteger(const CDescriptionField* field, int index);
double getDouble(const CDescriptionField* field);
double getDouble(const CDescriptionField* field, int index);
std::string getString(const CDescriptionField* field);
std::string getString(const CDescriptionField* field, int index);
int getIntegerAt(const CDescriptionField* field, int row, int column);
double getDoubleAt(const CDescriptionField* field, int row, int column);
std::string getStringAt(const CDescriptionField* field, int row, int column);
void setInteger(CDescriptionField* field, int value);
void setInteger(CDescriptionField* field, int index, int value);
void setDouble(CDescriptionField* field, double value);
void setDouble(CDescriptionField* field, int index, double value);
void setString(CDescriptionField* field, const std::string& value);
void setString(CDescriptionField* field, int index, const std::string& value);
void setIntegerAt(CDescriptionField* field, int row, int column, int value);
void setDoubleAt(CDescriptionField* field, int row, int column, double value);
void setStringAt(CDescriptionField* field, int row, int column, const std::string& value);
void resize(CDescriptionField* field, int rows, int columns);
void setNumberOfElements(CDescriptionField* field, int n);
void copyField(CDescriptionField* target, const CDescriptionField* source);
bool isSet(const CDescriptionField* field);
