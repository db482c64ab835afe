#include "cli/progress_display.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>

namespace vlr::cli {

namespace {

constexpr int kDefaultWidth = 80;
constexpr int kMinBarWidth = 10;
constexpr int kMaxBarWidth = 40;
// Redraws of the same percent are limited to this rate (the remaining time
// changes with each).
constexpr auto kRedrawInterval = std::chrono::milliseconds(250);
// Plain lines are written every this many percent.
constexpr int kPlainStep = 10;
// The estimate needs some progress to go by.
constexpr int kMinPercentForEstimate = 2;
constexpr double kMinSecondsForEstimate = 1.0;

}  // namespace

std::string RemainingTime(double elapsedSeconds, int percent) {
  if (percent < kMinPercentForEstimate || percent >= 100 ||
      !(elapsedSeconds >= kMinSecondsForEstimate))
    return "";
  const double left = elapsedSeconds * (100 - percent) / percent;
  const long s = std::lround(left);
  char text[32];
  if (s >= 3600) {
    std::snprintf(text, sizeof text, "%ld:%02ld:%02ld", s / 3600, s / 60 % 60, s % 60);
  } else {
    std::snprintf(text, sizeof text, "%ld:%02ld", s / 60, s % 60);
  }
  return text;
}

ProgressDisplay::ProgressDisplay(FILE* out, bool terminal, bool quiet)
    : out_(out), terminal_(terminal), quiet_(quiet) {}

int ProgressDisplay::width() const {
  winsize w{};
  if (ioctl(fileno(out_), TIOCGWINSZ, &w) == 0 && w.ws_col > 0) return w.ws_col;
  return kDefaultWidth;
}

std::string ProgressDisplay::remaining() const {
  const double elapsed = std::chrono::duration<double>(Clock::now() - stepStart_).count();
  return RemainingTime(elapsed, percent_);
}

void ProgressDisplay::clearLine() {
  if (barShown_) {
    std::fputs("\r\033[K", out_);
    barShown_ = false;
  }
}

void ProgressDisplay::draw(bool force) {
  if (quiet_) return;
  if (!terminal_) {
    const int tenth = percent_ / kPlainStep;
    if (!force && tenth == lastPlainTenth_) return;
    lastPlainTenth_ = tenth;
    const std::string left = remaining();
    std::fprintf(out_, "%s %d %%%s\n", title_.c_str(), percent_,
                 left.empty() ? "" : (", " + left + " left").c_str());
    std::fflush(out_);
    return;
  }
  const Clock::time_point now = Clock::now();
  if (!force && now - lastDraw_ < kRedrawInterval) return;
  lastDraw_ = now;
  const std::string left = remaining();
  const std::string tail =
      " " + std::to_string(percent_) + " %" + (left.empty() ? "" : "  " + left + " left");
  // The title takes what the bar and the numbers leave of the line.
  const int columns = width() - 1;
  const int barWidth = std::clamp(columns / 3, kMinBarWidth, kMaxBarWidth);
  std::string title = title_;
  const int titleRoom = columns - barWidth - 3 - static_cast<int>(tail.size());
  if (titleRoom < static_cast<int>(title.size())) title.resize(std::max(0, titleRoom));
  const int filled = barWidth * percent_ / 100;
  std::string bar = "[" + std::string(filled, '#') + std::string(barWidth - filled, '-') + "]";
  std::fprintf(out_, "\r\033[K%s %s%s", title.c_str(), bar.c_str(), tail.c_str());
  std::fflush(out_);
  barShown_ = true;
}

namespace {

// A title without the trailing dots and blanks the run puts behind it.
std::string trimmedTitle(const std::string& title) {
  std::string t = title;
  while (!t.empty() && (t.back() == ' ' || t.back() == '.')) t.pop_back();
  return t;
}

}  // namespace

void ProgressDisplay::stepIfNew(const std::string& title) {
  if (trimmedTitle(title) != stepName_) step(title);
}

void ProgressDisplay::step(const std::string& title) {
  const std::string t = trimmedTitle(title);
  if (t.empty()) return;
  // A step that runs again (one per sub-swath) is numbered.
  pass_ = t == stepName_ ? pass_ + 1 : 1;
  stepName_ = t;
  title_ = pass_ > 1 ? t + " (" + std::to_string(pass_) + ")" : t;
  percent_ = 0;
  lastPlainTenth_ = -1;
  stepStart_ = Clock::now();
  draw(true);
}

void ProgressDisplay::percent(int value) {
  value = std::clamp(value, 0, 100);
  if (value < percent_) {
    // A step that starts over (the next sub-swath) is timed afresh.
    stepStart_ = Clock::now();
    lastPlainTenth_ = -1;
  }
  const bool changed = value != percent_;
  percent_ = value;
  draw(changed && terminal_);
}

void ProgressDisplay::finish(bool success) {
  if (quiet_) return;
  if (success) {
    title_ = "Done";
    percent_ = 100;
    lastPlainTenth_ = -1;
    draw(true);
  }
  if (barShown_) {
    std::fputs("\n", out_);
    barShown_ = false;
  }
  std::fflush(out_);
}

void ProgressDisplay::note(const std::string& text) {
  if (quiet_) return;
  const bool barWasShown = barShown_;
  clearLine();
  std::fprintf(out_, "%s\n", text.c_str());
  std::fflush(out_);
  if (barWasShown) draw(true);
}

}  // namespace vlr::cli
