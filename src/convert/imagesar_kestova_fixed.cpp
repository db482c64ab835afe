// The fixed ENVISAT headers of an auxiliary file, carried into the suite
// header of a composed product.
//
// An ENVISAT file opens with its main product header (MPH, 1247 bytes) and
// its specific product header (SPH), both lines of KEY=value text; the MPH's
// SPH_SIZE keyword gives the size of the SPH (378 bytes for the ASA_XCA
// calibration file, 6099 for a wide-swath product, at most 6099 for any ASAR
// file).  Both blocks are copied, behind the section line
// "[EnvisatFixHeader]", into two temporary suite headers of the text form
// ("<suite header>_tmp1_hdr" and "_tmp2_hdr").  The text-form reader takes
// every KEY=value line of that section whose key the section defines, so
// reading the first temporary header gives the keywords as the file writes
// them; they are copied into the "EnvisatFixHeader" section of the product's
// header, which is then written again.  The temporary headers are removed
// whatever the outcome.
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "convert/imagesar_kestova_internal.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_handle.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"
#include "suite/description_header.h"

namespace {

using namespace kestova;

constexpr size_t kMphSize = 1247;
// The SPH_SIZE keyword and its value ("+0000000378") within the MPH.
constexpr size_t kSphSizeKeyOffset = 1104;
constexpr const char* kSphSizeKey = "SPH_SIZE=";
constexpr size_t kSphSizeValueOffset = 1113;
constexpr size_t kSphSizeValueLength = 11;
// Largest SPH of an ASAR file: a wide-swath product's 1059 bytes and its 18
// data set descriptors.
constexpr long kMaxSphSize = 6099;
// Section line that opens the text-form header (20 bytes).
constexpr const char kSectionLine[] = "\n[EnvisatFixHeader]\n";
constexpr const char* kTemporarySuffixes[] = {"_tmp1_hdr", "_tmp2_hdr"};

// Removes the temporary headers when the carry ends, however it ends.
class TemporaryFiles {
 public:
  explicit TemporaryFiles(const std::vector<std::string>& names) : names_(names) {}
  ~TemporaryFiles() {
    const int saved = errno;
    for (const std::string& n : names_) std::remove(n.c_str());
    for (const std::string& n : names_) VlrRunOutputRemoved(n.c_str());
    errno = saved;
  }
  TemporaryFiles(const TemporaryFiles&) = delete;
  TemporaryFiles& operator=(const TemporaryFiles&) = delete;

 private:
  std::vector<std::string> names_;
};

// Header text: printable ASCII and line ends only.  Anything else is not an
// ENVISAT header and would not read back as one.
bool IsHeaderText(const std::vector<char>& block) {
  for (const char c : block) {
    const unsigned char u = static_cast<unsigned char>(c);
    if (u != '\n' && (u < 0x20 || u > 0x7e)) return false;
  }
  return true;
}

// SPH size from the MPH; 0 when the keyword is missing or out of range.
long SphSize(const std::vector<char>& mph) {
  if (std::memcmp(mph.data() + kSphSizeKeyOffset, kSphSizeKey, std::strlen(kSphSizeKey)) != 0)
    return 0;
  const std::string value(mph.data() + kSphSizeValueOffset, kSphSizeValueLength);
  char* end = nullptr;
  const long size = std::strtol(value.c_str(), &end, 10);
  if (end == value.c_str() || size < 1 || size > kMaxSphSize) return 0;
  return size;
}

// Reads exactly block.size() bytes.
int ReadBlock(FILE* f, std::vector<char>* block) {
  VLR_SCOPE("ReadBlock", kModule);
  if (std::fread(block->data(), 1, block->size(), f) != block->size()) {
    errno = 0;
    VLR_FAIL("File reading failed!", vlr::kLibRead);
  }
  return 0;
}

// One temporary header: the section line, the MPH and the SPH.
int WriteTemporaryHeader(const std::string& name, const std::vector<char>& mph,
                         const std::vector<char>& sph) {
  VLR_SCOPE("WriteTemporaryHeader", kModule);
  FileHandle out(name.c_str(), "wb");
  if (out.get() == nullptr) {
    errno = 0;
    VLR_FAIL("File not opened!", vlr::kLibOpen);
  }
  VlrRunOutputBegun(name.c_str());
  const size_t sectionLength = sizeof kSectionLine - 1;
  const bool written = std::fwrite(kSectionLine, 1, sectionLength, out.get()) == sectionLength &&
                       std::fwrite(mph.data(), 1, mph.size(), out.get()) == mph.size() &&
                       std::fwrite(sph.data(), 1, sph.size(), out.get()) == sph.size();
  if (!written || !out.close()) {
    errno = 0;
    VLR_FAIL("File writing failed!", vlr::kLibWrite);
  }
  return 0;
}

// Copies every keyword read from the temporary header into the product's
// section.
void CopyFixedSection(CDescriptionHeader& fixed, CDescriptionHeader& header) {
  CDescriptionSection* from = findSection(fixed, kFixHeaderSection);
  CDescriptionSection* to = findSection(header, kFixHeaderSection);
  if (from == nullptr || to == nullptr) return;
  for (int i = 0; i < from->fieldCount(); ++i) {
    const CDescriptionField& source = from->field(i);
    CDescriptionField* target = to->findField(source.name());
    if (target != nullptr && source.isSet()) copyField(target, &source);
  }
}

}  // namespace

namespace kestova {

int CarryEnvisatFixHeader(CDescriptionHeader& header, CDescriptionHeader& fixed,
                          const char* suiteHeader, const char* aux) {
  VLR_SCOPE("CarryEnvisatFixHeader", kModule);
  if (aux == nullptr || aux[0] == '\0') VLR_FAIL("File not opened!", vlr::kLibOpen);
  FileHandle in(aux, "rb");
  if (in.get() == nullptr) {
    errno = 0;
    VLR_FAIL("File not opened!", vlr::kLibOpen);
  }
  std::vector<char> mph(kMphSize);
  VLR_CALL(ReadBlock(in.get(), &mph));
  const long sphSize = SphSize(mph);
  if (sphSize == 0 || !IsHeaderText(mph)) {
    VLR_FAIL(NVLR_UTILITY_Format("%s has no ENVISAT main product header", aux).c_str(),
             vlr::kLibInconsistent);
  }
  std::vector<char> sph(static_cast<size_t>(sphSize));
  VLR_CALL(ReadBlock(in.get(), &sph));
  if (!IsHeaderText(sph)) {
    VLR_FAIL(NVLR_UTILITY_Format("%s has no ENVISAT specific product header", aux).c_str(),
             vlr::kLibInconsistent);
  }
  in.close();

  std::vector<std::string> names;
  for (const char* suffix : kTemporarySuffixes) {
    names.push_back(std::string(suiteHeader) + suffix);
    if (names.back().size() > kKestovaMaxName)
      VLR_FAIL("Temporary header name too long", vlr::kLibInconsistent);
  }
  const TemporaryFiles temporaries(names);
  for (const std::string& name : names) VLR_CALL(WriteTemporaryHeader(name, mph, sph));

  // The first temporary header, by its name without the "_hdr" suffix.
  const std::string first = std::string(suiteHeader) + "_tmp1";
  fixed.clear();
  if (!readHeader(fixed, first.c_str())) {
    NVLR_UTILITY_TracePrint("Error: missing parameter file %s\n", first.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, first.c_str());
  }
  CopyFixedSection(fixed, header);
  writeHeader(header, suiteHeader);
  errno = 0;
  return 0;
}

}  // namespace kestova
