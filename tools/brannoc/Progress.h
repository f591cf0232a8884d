// A progress bar with the time left, on the standard error stream, drawn only when that is a
// terminal; at most five times a second.
#ifndef BRANNOC_TOOLS_PROGRESS_H
#define BRANNOC_TOOLS_PROGRESS_H

#include <chrono>

namespace brannoc::tool {

class ProgressBar {
 public:
  explicit ProgressBar(bool wanted);
  ~ProgressBar();
  ProgressBar(const ProgressBar&) = delete;
  ProgressBar& operator=(const ProgressBar&) = delete;

  void update(double fraction);

 private:
  bool itsShown;
  bool itsDrawn = false;
  std::chrono::steady_clock::time_point itsStart, itsLast;
};

}  // namespace brannoc::tool

#endif
