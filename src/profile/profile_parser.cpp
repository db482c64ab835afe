// Character-driven parser of parameter files.
#include <cstdio>
#include <new>

#include "profile/profile_store.h"

namespace vlr::profile {
namespace {

enum class State { kStart, kSectionName, kSkipLine, kLineStart, kKey, kValue };

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
        if (c == '[') openSection();
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
        } else if (c == '=') {
          state_ = State::kSkipLine;
        } else if (c != ' ') {
          token_.assign(1, c);
          state_ = State::kKey;
        }
        break;
      case State::kKey:
        if (c == '[') {
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
};

}  // namespace

void ParseProfile(std::FILE* stream, ProfileCacheEntry& entry) {
  try {
    Parser parser(entry);
    char block[4096];
    // Line ends are normalised as in text mode: a CR directly before a LF is
    // dropped.
    bool pendingCr = false;
    size_t got;
    while ((got = std::fread(block, 1, sizeof block, stream)) > 0) {
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
}

}  // namespace vlr::profile
