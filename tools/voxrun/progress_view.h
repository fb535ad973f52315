// How voxrun shows a running job: a redrawn progress bar with the elapsed time on a
// terminal, plain lines when the output is a file or a pipe, nothing when quiet.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

namespace voxrun {

class ProgressView {
 public:
  ProgressView(std::FILE* out, bool terminal, bool quiet)
      : out_(out), terminal_(terminal), quiet_(quiet) {}

  void ShowJobName(const std::string& name);
  // Called regularly; draws only what changed (a terminal redraws every second for the
  // clock).
  void Update(uint32_t percent, double elapsed_seconds);
  // A line of its own (the bar, if any, is cleared first and redrawn on the next update).
  void Note(const std::string& text);
  // Removes the bar before the closing line.
  void Finish();

 private:
  void ClearBar();

  std::FILE* out_;
  bool terminal_;
  bool quiet_;
  bool bar_drawn_ = false;
  int last_percent_ = -1;  // a terminal draws 0 %; plain lines start with the first rise
  long last_second_ = -1;
};

// "HH:MM:SS" (hours may exceed 24).
std::string ClockText(double seconds);
// The bar line itself: "[#####-----]  42%  00:01:05".
std::string BarText(uint32_t percent, double elapsed_seconds, int width);

}  // namespace voxrun
