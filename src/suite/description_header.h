// The suite header: a root tag and a list of sections, each created from its
// key file.  Read from and written to the ".sml" XML form; the older "_hdr"
// text form is read too.
#pragma once

#include <deque>
#include <string>
#include <vector>

#include "suite/description_section.h"

// Root tag of product headers.
constexpr const char* CVLR_HEADER_INFO = "HEADER_INFO";
// Namespace of the suite's header schema, declared on every "HEADER_INFO" root.
constexpr const char* CVLR_HEADER_NAMESPACE = "urn:veloran:schemas:header";
constexpr const char* CVLR_HEADER_SCHEMA_FILE = "VeloranHeaderSchema_version_1.0.xsd";
// The sections of a product header, in header order.
const std::vector<std::string>& NVLR_UTILITY_ProductHeaderSections();

// Most sections one header may hold ("All pools are busy" beyond).
constexpr int CVLR_DH_MAX_NBR_SECTIONS = 256;

class CDescriptionHeader {
 public:
  // Sections named by the arguments, up to a null; each defined from its key file.
  CDescriptionHeader(const char* section, ...);
  explicit CDescriptionHeader(const std::vector<std::string>& sections,
                              const std::string& initialTag = CVLR_HEADER_INFO);
  // An empty header (sections added with addSection).
  CDescriptionHeader() = default;

  std::string mInitialTag = CVLR_HEADER_INFO;

  int sectionCount() const { return static_cast<int>(mSections.size()); }
  CDescriptionSection& section(int i) { return mSections[static_cast<size_t>(i)]; }
  const CDescriptionSection& section(int i) const { return mSections[static_cast<size_t>(i)]; }
  // Appends a section without fields (848640 "All pools are busy" beyond the limit).
  CDescriptionSection* addSection(const std::string& name);
  // Appends a section defined from its key file.
  CDescriptionSection* addSectionFromKeyFile(const std::string& name);

  // Marks every field of every section unset.
  void clear();
  // "\n\n << Total number of Sections : n >>" and every section.
  std::string dumpText() const;

 private:
  std::deque<CDescriptionSection> mSections;
};

CDescriptionSection* findSection(CDescriptionHeader& header, const char* name);
const CDescriptionSection* findSection(const CDescriptionHeader& header, const char* name);
// "Section.Field" finds the field of that section; "Field" the first field of
// that name in header order.  Not found: the header is dumped to the trace and
// 848642 is raised with the path.
CDescriptionField* getField(CDescriptionHeader& header, const char* path);
// The same, but null when not found (no raise).
CDescriptionField* findField(CDescriptionHeader& header, const char* path);

// Reads the header named by fileName (resolved to ".sml" or "_hdr").  Returns
// false, after "\nFile : %s Not Found\n\n" in the process log, when neither
// form exists.  A file that cannot be parsed raises 261121.  With
// sectionBySection set every section is read on its own; a section missing
// from the file then raises 261122.
bool readHeader(CDescriptionHeader& header, const char* fileName, int sectionBySection = 0);
// Writes "<name>.sml" (name without "_hdr" or ".sml"), with the derived map
// grid and the "SOFTWARE" entry, then the ENVI header beside the product.
// 261124 when the file cannot be written.
void writeHeader(CDescriptionHeader& header, const char* fileName);
// Writes the ".sml" form to path as it stands; 261124 on failure.
void writeXML(const CDescriptionHeader& header, const char* path);
// Reads one section from a section description document or a ".sml" file;
// false when the document holds no such section.  Malformed XML raises 261121.
bool readFromXMLFile(CDescriptionSection& section, const char* path);
// Read exactly the given file, in the "_hdr" text form or the ".sml" form,
// into the sections of the header that it holds; false when the file does
// not exist.  A malformed file raises 261121.
bool readTextHeaderFile(CDescriptionHeader& header, const char* path);
bool readXmlHeaderFile(CDescriptionHeader& header, const char* path);
// Reports every mandatory field that is not set to the process log.
void checkMandatoryFields(CDescriptionHeader& header);
