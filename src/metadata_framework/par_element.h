// One field descriptor of a metadata section: where the value lives, its
// type and count, its stored range and whether a read must find it.
#pragma once

#include <cstddef>
#include <string>

// Capacity of the character buffers that hold string fields.
constexpr size_t kParStringSize = 512;

class parElement {
 public:
  enum ParameterType { PT_DOUBLE = 0, PT_FLOAT = 1, PT_INT = 2, PT_STRING = 3, PT_NONE = 4 };

  parElement() = default;

  // Fills the descriptor.  `scalar` follows the count only at the first
  // registration; a re-registration keeps it.  Returns 0.
  int setElement(const char* name, void* value, ParameterType type, int count, double min,
                 double max, bool mandatory);

  bool isNumeric() const { return type == PT_DOUBLE || type == PT_FLOAT || type == PT_INT; }

  std::string name;
  ParameterType type = PT_NONE;
  int count = 0;          // values stored; 0 = not stored
  void* value = nullptr;  // char buffer, array of char pointers, or first number
  double min = 0.0;       // stored range, not enforced
  double max = 0.0;
  bool mandatory = false;
  bool scalar = false;  // count was 1 at the first registration
  bool registered = false;
  // String fields: capacity of each buffer, and whether `value` is an array
  // of char pointers rather than one buffer.
  size_t stringSize = kParStringSize;
  bool stringArray = false;
};
