#include "tools/report/plot.h"

#include <stddef.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "tools/base/text.h"

namespace tool {

namespace {

// The coordinates inside the drawing.
constexpr double kWidth = 1000;
constexpr double kHeight = 100;
constexpr size_t kMostPoints = 1000;

struct Scale {
  double low;
  double high;
  double seconds;

  double x(double time) const { return seconds > 0 ? time / seconds * kWidth : 0; }
  double y(double value) const { return kHeight - (value - low) / (high - low) * kHeight; }
};

Series thinned(const Series& series) {
  const size_t group = (series.points.size() + kMostPoints - 1) / kMostPoints;
  if (group <= 1) return series;
  Series result{series.style, series.drawn, series.extreme, {}};
  for (size_t at = 0; at < series.points.size(); at += group) {
    const auto begin = series.points.begin() + static_cast<ptrdiff_t>(at);
    const auto end = begin + static_cast<ptrdiff_t>(std::min(group, series.points.size() - at));
    const auto less = [](const auto& one, const auto& other) { return one.second < other.second; };
    result.points.push_back(series.extreme == Extreme::Lowest ? *std::min_element(begin, end, less)
                                                              : *std::max_element(begin, end, less));
  }
  return result;
}

std::string pathOf(const Series& series, const Scale& scale) {
  std::string path;
  bool isDown = false;
  for (const auto& [time, value] : series.points) {
    if (std::isnan(value)) {
      isDown = false;
      continue;
    }
    const double x = scale.x(time);
    const double y = scale.y(value);
    if (series.drawn == Drawn::Bars) {
      path += formatted("M%.1f %gV%.1f", x, kHeight, y);
    } else if (!isDown) {
      path += formatted("M%.1f %.1f", x, y);
    } else if (series.drawn == Drawn::Steps) {
      path += formatted("H%.1fV%.1f", x, y);
    } else {
      path += formatted("L%.1f %.1f", x, y);
    }
    isDown = true;
  }
  if (series.drawn == Drawn::Steps && isDown) path += formatted("H%g", kWidth);
  return formatted("<path class=\"%s\" d=\"", series.style) + path + "\"/>";
}

std::string markers(const Marks& marks, const Scale& scale) {
  std::string svg;
  for (const auto& [from, until] : marks.frozen) {
    svg += formatted("<rect class=\"frozen\" x=\"%.1f\" y=\"0\" width=\"%.1f\" height=\"%g\"/>",
                     scale.x(from), std::max(1.0, scale.x(until) - scale.x(from)), kHeight);
  }
  for (const double loss : marks.losses) {
    svg += formatted("<path class=\"loss\" d=\"M%.1f 0V7\"/>", scale.x(loss));
  }
  for (const double change : marks.changes) {
    svg += formatted("<path class=\"change\" d=\"M%.1f 0V%g\"/>", scale.x(change), kHeight);
  }
  return svg;
}

Scale scaleOf(const Plot& plot, double seconds) {
  double low = std::numeric_limits<double>::max();
  double high = std::numeric_limits<double>::lowest();
  for (const Series& series : plot.series) {
    for (const auto& [time, value] : series.points) {
      if (std::isnan(value)) continue;
      low = std::min(low, value);
      high = std::max(high, value);
    }
  }
  if (low > high) low = high = 0;
  if (plot.fromZero) low = 0;
  if (high - low < 1e-9) high = low + 1;
  const double room = (high - low) * 0.08;
  return {plot.fromZero ? 0 : low - room, high + room, seconds};
}

}  // namespace

std::vector<double> ticks(double low, double high, int most) {
  const double rough = (high - low) / std::max(1, most);
  const double power = std::pow(10, std::floor(std::log10(rough)));
  double step = power * 10;
  for (const double factor : {1.0, 2.0, 5.0}) {
    if (power * factor >= rough) {
      step = power * factor;
      break;
    }
  }
  std::vector<double> values;
  for (double at = std::ceil(low / step) * step; at <= high + step * 1e-9; at += step) {
    values.push_back(std::abs(at) < step * 1e-9 ? 0 : at);
  }
  return values;
}

std::string renderPlot(const Plot& plot, double seconds, const Marks& marks) {
  const Scale scale = scaleOf(plot, seconds);
  std::string labels;
  std::string lines;
  for (const double tick : ticks(scale.low, scale.high, 4)) {
    const double y = scale.y(tick);
    labels += formatted("<span style=\"top:%.1f%%\">%g</span>", y / kHeight * 100, tick);
    lines += formatted("<path class=\"grid\" d=\"M0 %.1fH%g\"/>", y, kWidth);
  }
  std::string times;
  for (const double tick : ticks(0, seconds, 5)) {
    times += formatted("<span style=\"left:%.1f%%\">%g s</span>", scale.x(tick) / kWidth * 100, tick);
  }
  std::string numbers;
  for (size_t i = 0; i < marks.changes.size(); ++i) {
    numbers += formatted("<b style=\"left:%.1f%%\">%zu</b>", scale.x(marks.changes[i]) / kWidth * 100, i + 1);
  }
  std::string drawing;
  for (const Series& series : plot.series) drawing += pathOf(thinned(series), scale);

  const std::string title(plot.title);
  const std::string unit(plot.unit);
  return "<figure class=\"plot\"><figcaption>" + title + " <small>" + unit +
         "</small></figcaption><div class=\"numbers\">" + numbers + "</div><div class=\"values\">" + labels +
         formatted("</div><svg viewBox=\"0 0 %g %g\" preserveAspectRatio=\"none\" role=\"img\" aria-label=\"",
                   kWidth, kHeight) +
         title + " over time\">" + lines + markers(marks, scale) + drawing + "</svg><div class=\"times\">" +
         times + "</div></figure>\n";
}

}  // namespace tool
