// Error and warning catalogs: a title per group and texts per code.
#pragma once

#include <string>
#include <vector>

struct ErrorCatalog {
  struct Group {
    std::string key;
    std::string title;
    std::vector<std::string> texts;
  };
  std::vector<Group> groups;

  bool empty() const { return groups.empty(); }
  void clear() { groups.clear(); }
};

// Parses catalog lines (as the list-file reader returns them).  Counts that
// are missing, negative or larger than the file are reduced to what the
// lines hold.
ErrorCatalog ParseErrorCatalog(const std::vector<std::string>& lines);
// Reads a catalog file through the list-file reader (raises 261122 when the
// file is absent).
ErrorCatalog LoadErrorCatalog(const std::string& path);

enum class VlrCatalog { Errors, Warnings };
ErrorCatalog& NVLR_UTILITY_Catalog(VlrCatalog which);

// Group title and code text of code (the two-buffer lookup).
void NVLR_UTILITY_GetErrorTexts(const ErrorCatalog& catalog, int code, std::string& title,
                                std::string& text);
// The single-buffer forms used in the error file.
std::string NVLR_UTILITY_ErrorTitleLine(const ErrorCatalog& catalog, int code);
std::string NVLR_UTILITY_ErrorTextLine(const ErrorCatalog& catalog, int code);
