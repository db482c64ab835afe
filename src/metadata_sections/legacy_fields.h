// The older parameter-file form of a metadata section: one "key = value"
// record per field in a section of the same name as the XML block.
#pragma once

#include "metadata_framework/general_sar_base.h"

// Reads the registered fields of `section` from the parameter file `file`.
// The key of field i is keys[i] (nullptr skips the field); without `keys`
// the keys are the field names.  A mandatory field whose key is missing or
// holds too few values fails the read (1, after the other fields have been
// read); optional fields that are missing keep their values.  Fields with a
// count of 0 are skipped.
int readLegacyFields(GeneralSAR_BaseXML& section, const char* file, const char* sectionName,
                     const char* const* keys = nullptr);
