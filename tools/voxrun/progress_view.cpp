#include "progress_view.h"

namespace voxrun {

std::string ClockText(double seconds) {
  const long total = seconds < 0 ? 0 : static_cast<long>(seconds);
  char text[32];
  std::snprintf(text, sizeof text, "%02ld:%02ld:%02ld", total / 3600, total / 60 % 60, total % 60);
  return text;
}

std::string BarText(uint32_t percent, double elapsed_seconds, int width) {
  if (percent > 100) percent = 100;
  const int filled = static_cast<int>(percent) * width / 100;
  std::string bar = "[";
  bar.append(static_cast<size_t>(filled), '#');
  bar.append(static_cast<size_t>(width - filled), '-');
  char tail[48];
  std::snprintf(tail, sizeof tail, "] %3u%%  %s", percent, ClockText(elapsed_seconds).c_str());
  return bar + tail;
}

void ProgressView::ShowJobName(const std::string& name) {
  if (quiet_) return;
  Note("job: " + (name.empty() ? std::string("(no name)") : name));
}

void ProgressView::Update(uint32_t percent, double elapsed_seconds) {
  if (quiet_) return;
  const long second = static_cast<long>(elapsed_seconds);
  if (terminal_) {
    if (static_cast<int>(percent) == last_percent_ && second == last_second_ && bar_drawn_) return;
    std::fprintf(out_, "\r%s", BarText(percent, elapsed_seconds, 40).c_str());
    bar_drawn_ = true;
  } else {
    if (static_cast<int>(percent) == last_percent_ || (last_percent_ < 0 && percent == 0)) return;
    std::fprintf(out_, "progress %u%% after %s\n", percent, ClockText(elapsed_seconds).c_str());
  }
  std::fflush(out_);
  last_percent_ = static_cast<int>(percent);
  last_second_ = second;
}

void ProgressView::Note(const std::string& text) {
  ClearBar();
  std::fprintf(out_, "%s\n", text.c_str());
  std::fflush(out_);
}

void ProgressView::Finish() {
  ClearBar();
}

void ProgressView::ClearBar() {
  if (!bar_drawn_) return;
  std::fprintf(out_, "\r\033[K");
  bar_drawn_ = false;
}

}  // namespace voxrun
