// Progress of a run on standard error: a redrawn bar on a terminal, plain
// lines otherwise.
#pragma once

#include <chrono>
#include <cstdio>
#include <string>

namespace vlr::cli {

class ProgressDisplay {
 public:
  // terminal: draw a bar redrawn in place; else write plain lines.  quiet:
  // write nothing.
  ProgressDisplay(FILE* out, bool terminal, bool quiet);

  // A new step of the run (the title the run gives it).
  void step(const std::string& title);
  // A step named by the message of a progress update: a new step unless it
  // is the current one.
  void stepIfNew(const std::string& title);
  // The current step's percent, 0 to 100.
  void percent(int value);
  // Ends the display: a successful run shows 100 %.
  void finish(bool success);
  // A message on a line of its own, not overwritten by the bar.
  void note(const std::string& text);

 private:
  using Clock = std::chrono::steady_clock;

  void draw(bool force);
  void clearLine();
  std::string remaining() const;
  int width() const;

  FILE* out_;
  bool terminal_;
  bool quiet_;
  std::string title_ = "Starting";
  std::string stepName_;
  int pass_ = 1;
  int percent_ = 0;
  int lastPlainTenth_ = -1;
  bool barShown_ = false;
  Clock::time_point stepStart_ = Clock::now();
  Clock::time_point lastDraw_{};
};

// Remaining time as "m:ss" or "h:mm:ss" from the seconds a step took to reach
// percent; "" while there is not enough to go by.
std::string RemainingTime(double elapsedSeconds, int percent);

}  // namespace vlr::cli
