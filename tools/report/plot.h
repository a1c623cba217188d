// Plots over time as SVG, which the page around them stretches to its width and colours by class.
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tool {

enum class Drawn {
  Line,
  Steps,  // holds until the next point
  Bars,
};

// What stands for several points that fall onto one pixel.
enum class Extreme { Lowest, Highest };

struct Series {
  const char* style;  // a class of the page
  Drawn drawn = Drawn::Line;
  Extreme extreme = Extreme::Highest;
  // Time and value; in a line a value that is not a number leaves a gap.
  std::vector<std::pair<double, double>> points;
};

// What is marked in every plot of a page.
struct Marks {
  std::vector<double> changes;  // numbered from 1 on
  std::vector<double> losses;
  std::vector<std::pair<double, double>> frozen;  // from when until when nothing new was shown
};

struct Plot {
  std::string_view title;
  std::string_view unit;
  std::vector<Series> series;
  bool fromZero = true;  // else the scale begins near the lowest value
};

// `seconds`: the length of the time axis.
std::string renderPlot(const Plot& plot, double seconds, const Marks& marks);

// Round values between the two, at least two of them.
std::vector<double> ticks(double low, double high, int most);

}  // namespace tool
