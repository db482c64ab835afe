// Choice of the auxiliary files of a product from a folder of ESA files, by
// the validity dates in their names.
#pragma once

#include <string>
#include <vector>

namespace vlr::cli {

// An ESA auxiliary file name such as
// ASA_XCA_AXVIEC20031217_140353_20030211_000000_20041231_000000: product
// ID, processing stage and originator, then creation time, validity start
// and validity stop (yyyymmdd_hhmmss, UTC).  Times in seconds since 1985.
struct AuxFileName {
  std::string name;
  double created = 0.0;
  double validFrom = 0.0;
  double validTo = 0.0;
};

// Reads name as an auxiliary file of type ("ASA_XCA", "ASA_INS"); an
// extension behind the last date (".txt") is allowed.  False for any other
// name, or one whose dates are not dates.
bool ParseAuxFileName(const std::string& name, const std::string& type, AuxFileName& out);

// The file among names of type valid at time t (validFrom <= t < validTo);
// several valid: the latest created, then the last name.  False when none.
bool ChooseAuxFile(const std::vector<std::string>& names, const std::string& type, double t,
                   AuxFileName& chosen);

// The sensing start of an ENVISAT product (its main product header) in
// seconds since 1985; false with a message when it cannot be read.
bool ProductSensingStart(const std::string& product, double& t, std::string& error);

// The names of the regular files in dir; false with a message when the
// folder cannot be read.
bool ListFolder(const std::string& dir, std::vector<std::string>& names, std::string& error);

}  // namespace vlr::cli
