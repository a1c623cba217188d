#include "bench/soak/report.h"

#include "tools/base/text.h"
#include "tools/report/page_style.h"
#include "tools/report/plot.h"

namespace bench {

std::string soakPage(const std::string& title, const std::vector<Sample>& samples) {
  std::string plots;
  for (const Line& line : lines()) {
    tool::Series series{"line", tool::Drawn::Line, tool::Extreme::Highest, {}};
    for (const Sample& sample : samples) series.points.emplace_back(sample.time, line.value(sample));
    const Flatness level = flatness(line, samples);
    plots += tool::renderPlot({line.name, line.unit, {series}}, samples.back().time, {});
    plots += tool::formatted("<p>%s: %.4g in the middle third, %.4g in the last.</p>\n",
                             level.isFlat ? "Flat" : "NOT FLAT", level.before, level.after);
  }
  return "<!DOCTYPE html>\n<html lang=\"en\"><head><meta charset=\"utf-8\"><title>" + title +
         "</title><style>" + tool::kPageStyle + "</style></head><body><main>\n<h1>" + title + "</h1>\n" +
         plots + "</main></body></html>\n";
}

}  // namespace bench
