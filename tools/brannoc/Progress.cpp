// The bar: "[=====>     ]  45%  0:12 elapsed, about 0:15 left".
#include "Progress.h"

#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <string>

namespace brannoc::tool {

namespace {

constexpr int kWidth = 30;

std::string clock(double seconds) {
  const auto s = static_cast<long>(seconds + 0.5);
  return s >= 3600 ? fmt::format("{}:{:02}:{:02}", s / 3600, s / 60 % 60, s % 60)
                   : fmt::format("{}:{:02}", s / 60, s % 60);
}

}  // namespace

ProgressBar::ProgressBar(bool wanted)
    : itsShown(wanted && isatty(STDERR_FILENO) == 1),
      itsStart(std::chrono::steady_clock::now()),
      itsLast(itsStart) {}

ProgressBar::~ProgressBar() {
  if (itsDrawn) fmt::print(stderr, "\r{:{}}\r", "", kWidth + 48);
}

void ProgressBar::update(double fraction) {
  const auto now = std::chrono::steady_clock::now();
  if (!itsShown || now - itsLast < std::chrono::milliseconds(200)) return;
  itsLast = now;
  fraction = std::clamp(fraction, 0.0, 1.0);
  const double elapsed = std::chrono::duration<double>(now - itsStart).count();
  const int filled = static_cast<int>(fraction * kWidth);
  const std::string bar =
      std::string(static_cast<std::size_t>(filled), '=') + (filled < kWidth ? ">" : "") +
      std::string(static_cast<std::size_t>(std::max(kWidth - filled - 1, 0)), ' ');
  const std::string left =
      fraction > 0.01 ? "about " + clock(elapsed * (1 - fraction) / fraction) + " left" : "";
  fmt::print(stderr, "\r[{}] {:3.0f}%  {} elapsed, {:<20}", bar, 100 * fraction, clock(elapsed),
             left);
  std::fflush(stderr);
  itsDrawn = true;
}

}  // namespace brannoc::tool
