// Base classes of the metadata sections.
//
// A section lists its fields once, in refreshParameters(), through the
// addElement* calls; the framework reads and writes the section from that
// list as one block of a channel of the XML auxiliary document.
//
//   class Pulse : public GeneralSAR_Base {
//    public:
//     Pulse() { createElementsVector(2); }
//    protected:
//     void refreshParameters() override {
//       addElementDouble("PulseLength", &length, 1, 0.0, 1.0, true);
//       addElementInt("Samples", &samples, 1, 0, 100000, true);
//       setAllocationFlag(true);
//     }
//     double length = -999;
//     int samples = -999;
//   };
//
// Reading runs in two passes: the numeric scalars first (they give the sizes
// of variable arrays), then createBuffers(), which allocates those arrays and
// calls refreshParameters() again so that the descriptors point at them, and
// then every field.  createBuffers() must validate every size it takes from
// the file (checkCount) before allocating.
//
// Copies of a section re-register their fields on first use, so that the
// descriptors of a copy point at the copy's members.  A section that owns
// buffers must copy them itself (or forbid copying).
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "metadata_framework/par_element.h"
#include "metadata_framework/tessal_xml.h"

class GeneralSAR_BaseXML {
 public:
  GeneralSAR_BaseXML() = default;
  GeneralSAR_BaseXML(const GeneralSAR_BaseXML& other);
  GeneralSAR_BaseXML& operator=(const GeneralSAR_BaseXML& other);
  virtual ~GeneralSAR_BaseXML();

  // Allocate and free the section's variable-size arrays.  Defaults: nothing, 0.
  virtual int createBuffers();
  virtual int destroyBuffers();

  bool isBufferAllocated() const { return allocated_; }

  // Loads `file` (a new document when it is absent or not recognised) and
  // selects the channel and the section path.  Returns 0.
  int setAuxiliaryFile(const char* file, int channel, const char* section);
  void unsetAuxiliaryFile();
  // Reads the section from the loaded document: 0, 1 when a mandatory field
  // is missing or the buffers do not exist, or the code of createBuffers().
  int readAuxiliaryFile();
  // Replaces the section in the document and saves it: 0, 1 when the buffers
  // do not exist or a field cannot be stored, 5 when the file cannot be saved.
  int writeAuxiliaryFile();
  // Set, read or write, unset.  The read form is true on success.
  bool readAuxiliaryFile(const char* file, int channel, const char* section);
  int writeAuxiliaryFile(const char* file, int channel, const char* section);
  // Removes the section from the loaded document (not saved).  Returns 0.
  int cleanAuxiliaryFile();
  bool checkAuxiliaryFile() { return true; }
  bool checkAuxiliaryFile(const char*, int, const char*) { return true; }
  // Reads section/"ConfigurationFile" into `out` (`size` bytes).
  bool getConfigurationFile(const char* file, int channel, const char* section, char* out,
                            size_t size = kParStringSize);

  // The descriptors, for inspection.
  int elementCount() const { return static_cast<int>(elements_.size()); }
  const parElement& element(int i);

 protected:
  // Registers the section's fields, always in the same order.
  virtual void refreshParameters() {}

  // Builds n fresh descriptors and registers the fields.  1 when
  // refreshParameters() did not register exactly n of them.
  int createElementsVector(int n);
  void destroyElementsVector();

  // Fill the descriptor at the cursor and advance it; the cursor wraps to 0
  // after the last descriptor.  1 when there is no descriptor to fill.
  int addElementInt(const char* name, int* ptr, int count, int min, int max, bool mandatory);
  int addElementFloat(const char* name, float* ptr, int count, float min, float max,
                      bool mandatory);
  int addElementDouble(const char* name, double* ptr, int count, double min, double max,
                       bool mandatory);
  // One string held in a buffer of `size` bytes.
  int addElementString(const char* name, char* ptr, bool mandatory, size_t size = kParStringSize);
  // `count` strings, each in a buffer of `size` bytes.
  int addElementString(const char* name, char** ptr, int count, bool mandatory,
                       size_t size = kParStringSize);

  void setAllocationFlag(bool allocated) { allocated_ = allocated; }

  // For createBuffers(): 0 when 0 <= n <= maxCount, else reports
  // "Invalid number of elements %d for '%s'" and returns 1.
  int checkCount(const char* field, int n, int maxCount);

  tessalxml& document() { return xml_; }
  int channel() const { return channel_; }
  const std::string& sectionPath() const { return section_; }

 private:
  int addElement(const char* name, void* ptr, parElement::ParameterType type, int count, double min,
                 double max, bool mandatory, size_t size, bool stringArray);
  // Re-registers the fields when the descriptors were built for another object.
  void ensureRegistered();
  int readElement(parElement& e, int count);
  int writeElement(const parElement& e);
  std::string fieldPath(const parElement& e) const;

  int cursor_ = 0;
  int registrations_ = 0;  // fields registered since the vector was built
  std::vector<parElement> elements_;
  const GeneralSAR_BaseXML* registeredFor_ = nullptr;
  bool allocated_ = false;
  tessalxml xml_;
  int channel_ = 0;
  std::string file_;
  std::string section_;
};

class GeneralSAR_Base : public GeneralSAR_BaseXML {
 public:
  // Header operations of a section.  Defaults: nothing, 0.
  virtual int writehdr();
  virtual int writehdr(const char* file);
  virtual int readhdr(const char* file);
};
