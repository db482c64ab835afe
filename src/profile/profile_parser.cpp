// Character-driven parser of parameter files.
#include <cstdio>
#include <new>

#include "profile/profile_store.h"

namespace vlr::profile {
namespace {

enum class State { kStart, kSectionName, kSkipLine, kLineStart, kKey, kValue };

// Characters of a blank line.
constexpr const char* kBlanks = " \t\r";

bool IsBlank(char c) {
  return c == ' ' || c == '\t' || c == '\r';
}
// First non-blank character of a comment line.
bool IsCommentMark(char c) {
  return c == '#' || c == ';';
}

// Trims the space character (only) from both ends.
std::string Trim(const std::string& text) {
  const size_t first = text.find_first_not_of(' ');
  if (first == std::string::npos) return std::string();
  const size_t last = text.find_last_not_of(' ');
  return text.substr(first, last - first + 1);
}

class Parser {
 public:
  explicit Parser(ProfileCacheEntry& entry) : entry_(entry) { token_.reserve(4096); }

  void feed(char c) {
    switch (state_) {
      case State::kStart:
        beforeSections(c);
        break;
      case State::kSectionName:
        if (c == ']') {
          ProfileSection& section = *entry_.sections.back();
          section.name = Trim(token_);
          section.named = true;
          state_ = State::kSkipLine;
        } else {
          token_ += c;
        }
        break;
      case State::kSkipLine:
        if (c == '\n') state_ = State::kLineStart;
        break;
      case State::kLineStart:
        if (c == '[') {
          openSection();
        } else if (c == '=' || IsCommentMark(c)) {
          state_ = State::kSkipLine;
        } else if (c != ' ' && c != '\n') {
          token_.assign(1, c);
          lineBegin_ = 0;
          state_ = State::kKey;
        }
        break;
      case State::kKey:
        if (c == '\n') {
          endKeyLine();
        } else if ((c == '[' || c == '=') && inCommentLine()) {
          token_ += c;
        } else if (c == '[') {
          openSection();
        } else if (c == '=') {
          key_ = Trim(token_);
          token_.clear();
          state_ = State::kValue;
        } else {
          token_ += c;
        }
        break;
      case State::kValue:
        if (c == '\n') {
          storeRecord();
          state_ = State::kLineStart;
        } else {
          token_ += c;
        }
        break;
    }
  }

  // A value in progress at the end of the text is kept; a key without '='
  // is dropped.
  void finish() {
    if (state_ == State::kValue) storeRecord();
  }

 private:
  // Text before the first section is ignored, except that a '[' opens one;
  // a '[' inside a comment line does not.
  void beforeSections(char c) {
    if (c == '\n') {
      lineFresh_ = true;
      inComment_ = false;
      return;
    }
    if (inComment_) return;
    if (lineFresh_) {
      if (IsBlank(c)) return;
      if (IsCommentMark(c)) {
        inComment_ = true;
        return;
      }
      lineFresh_ = false;
    }
    if (c == '[') openSection();
  }
  // The current line of the key, from lineBegin_, starts with '#' or ';'
  // after its blanks.
  bool inCommentLine() const {
    const size_t first = token_.find_first_not_of(kBlanks, lineBegin_);
    return first != std::string::npos && IsCommentMark(token_[first]);
  }
  // A line without '=' ends.  A blank or comment line is dropped, so that it
  // cannot become part of the next key; any other line stays in front of
  // the next key, line feed included (as the rows after the first of a
  // written matrix do).
  void endKeyLine() {
    const size_t first = token_.find_first_not_of(kBlanks, lineBegin_);
    if (first == std::string::npos || IsCommentMark(token_[first])) {
      token_.resize(lineBegin_);
      if (token_.empty()) state_ = State::kLineStart;
      return;
    }
    token_ += '\n';
    lineBegin_ = token_.size();
  }
  void openSection() {
    entry_.sections.push_back(std::make_unique<ProfileSection>());
    token_.clear();
    state_ = State::kSectionName;
  }
  void storeRecord() {
    auto record = std::make_unique<ProfileEntry>();
    record->key = std::move(key_);
    record->value = Trim(token_);
    entry_.sections.back()->records.push_back(std::move(record));
    key_.clear();
    token_.clear();
  }

  ProfileCacheEntry& entry_;
  State state_ = State::kStart;
  std::string token_;
  std::string key_;
  size_t lineBegin_ = 0;    // start of the key's current line in token_
  bool lineFresh_ = true;   // before a section: nothing but blanks read on this line
  bool inComment_ = false;  // before a section: inside a comment line
};

}  // namespace

bool ParseProfile(std::FILE* stream, ProfileCacheEntry& entry, long long maxBytes) {
  try {
    Parser parser(entry);
    char block[4096];
    long long total = 0;
    // Line ends are normalised as in text mode: a CR directly before a LF is
    // dropped.
    bool pendingCr = false;
    size_t got;
    while ((got = std::fread(block, 1, sizeof block, stream)) > 0) {
      total += static_cast<long long>(got);
      if (total > maxBytes) return false;
      for (size_t i = 0; i < got; ++i) {
        const char c = block[i];
        if (pendingCr) {
          pendingCr = false;
          if (c != '\n') parser.feed('\r');
        }
        if (c == '\r') {
          pendingCr = true;
          continue;
        }
        parser.feed(c);
      }
    }
    if (pendingCr) parser.feed('\r');
    parser.finish();
  } catch (const std::bad_alloc&) {
    ProfileOutOfMemory(true);
  }
  return true;
}

}  // namespace vlr::profile
