#include "tools/commands/compare.h"

#include <inttypes.h>

#include <nlohmann/json.hpp>

#include "tools/base/text.h"
#include "tools/commands/progress_bar.h"
#include "tools/video/psnr.h"
#include "tools/video/ssim.h"

namespace tool {

namespace {

PictureDifference difference(const Picture& one, const Picture& other) {
  const size_t chroma = one.lumaBytes() / 4;
  const auto plane = [&](const Picture& picture, size_t number) {
    return std::span(picture.bytes).subspan(picture.lumaBytes() + number * chroma, chroma);
  };
  return {.psnrY = psnr(one.luma(), other.luma()),
          .psnrU = psnr(plane(one, 0), plane(other, 0)),
          .psnrV = psnr(plane(one, 1), plane(other, 1)),
          .ssimY = ssim(one.luma(), other.luma(), one.size)};
}

void add(PictureDifference& sum, const PictureDifference& each, double weight) {
  sum.psnrY += each.psnrY * weight;
  sum.psnrU += each.psnrU * weight;
  sum.psnrV += each.psnrV * weight;
  sum.ssimY += each.ssimY * weight;
}

nlohmann::ordered_json json(const PictureDifference& each) {
  return {{"psnr_y", rounded(each.psnrY)},
          {"psnr_u", rounded(each.psnrU)},
          {"psnr_v", rounded(each.psnrV)},
          {"ssim_y", std::round(each.ssimY * 1e6) / 1e6}};
}

std::string line(const std::string& label, const PictureDifference& each) {
  return formatted("%-14s %8.2f %8.2f %8.2f %10.4f\n", label.c_str(), each.psnrY, each.psnrU, each.psnrV,
                   each.ssimY);
}

}  // namespace

Result<CompareReport> runCompare(FrameSource& one, FrameSource& other, std::stop_source& enough) {
  if (one.size() != other.size()) {
    return Failure{
        ExitCode::Input,
        formatted("the pictures differ in size, %dx%d and %dx%d: scale one of them first (omxbridge "
                  "convert --scale)",
                  one.size().width, one.size().height, other.size().width, other.size().height)};
  }
  CompareReport report;
  Picture pictureOne;
  Picture pictureOther;
  const auto take = [&report](FrameSource& source, Picture& picture) {
    const auto more = source.next(picture);
    if (!more.ok() && !report.inputFailure) report.inputFailure = more.failure();
    return more.ok() && more.value();
  };
  ProgressBar progress(one.frameCount());
  while (!enough.stop_requested()) {
    const bool isOne = take(one, pictureOne);
    const bool isOther = take(other, pictureOther);
    if (enough.stop_requested() || (!isOne && !isOther)) break;
    if (isOne && isOther) {
      report.pictures.push_back(difference(pictureOne, pictureOther));
      progress.update(report.pictures.size());
    } else {
      ++(isOne ? report.surplusOne : report.surplusOther);
    }
  }
  for (const PictureDifference& each : report.pictures) {
    add(report.mean, each, 1.0 / static_cast<double>(report.pictures.size()));
  }
  return report;
}

std::string compareSummary(const CompareReport& report, bool perPicture) {
  std::string text = formatted("%-14s %8s %8s %8s %10s\n", "", "PSNR Y", "U", "V", "SSIM Y");
  for (size_t i = 0; perPicture && i < report.pictures.size(); ++i) {
    text += line(std::to_string(i), report.pictures[i]);
  }
  text += line("Mean", report.mean);
  text += formatted("%-14s %zu compared", "Pictures", report.pictures.size());
  if (report.surplusOne > 0) text += formatted(", %" PRIu64 " more in the first file", report.surplusOne);
  if (report.surplusOther > 0)
    text += formatted(", %" PRIu64 " more in the second file", report.surplusOther);
  return text + "\n";
}

std::string compareJson(const CompareReport& report, bool interrupted) {
  nlohmann::ordered_json object = json(report.mean);
  object["frames_compared"] = report.pictures.size();
  object["frames_only_in_first"] = report.surplusOne;
  object["frames_only_in_second"] = report.surplusOther;
  object["frames"] = nlohmann::ordered_json::array();
  for (const PictureDifference& each : report.pictures) object["frames"].push_back(json(each));
  object["interrupted"] = interrupted;
  return object.dump() + "\n";
}

}  // namespace tool
