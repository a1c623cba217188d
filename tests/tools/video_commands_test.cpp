// encode, decode, convert and compare as a user runs them, one feeding the other; the measures of difference,
// and what devices give.
#include <gtest/gtest.h>

#include "tests/tools/process.h"
#include "tools/video/device_layout.h"
#include "tools/video/psnr.h"
#include "tools/video/ssim.h"

namespace {

using namespace tool;
using namespace tooltest;

// What is encoded into each kind of file decodes to the same pictures, on every road into the decoder.
TEST(VideoCommands, EncodeIntoFilesThatDecodeAlike) {
  const TemporaryDirectory directory;
  const std::string stream = directory.file("a.264"), mp4 = directory.file("a.mp4");
  std::vector<std::string> scene{"encode", "-s", "96x80", "-n", "25", "--fps", "12.5", "-k", "10", "-o"};
  scene.push_back(stream);
  const json figures = report(scene);
  EXPECT_EQ(figures["frames_encoded"], 25);
  EXPECT_EQ(figures["key_frames"], 3);
  EXPECT_EQ(figures["bytes"], contentOf(stream).size());
  scene.back() = mp4;
  EXPECT_EQ(report(scene)["frames_encoded"], 25);
  scene.back() = "-";
  scene.insert(scene.end(), {"--format", "mp4"});
  const std::string fragments = directory.write("fragments.mp4", runTool(scene).out);

  const Ended sums = runTool({"decode", stream, "-o", "-", "--format", "hash"});
  EXPECT_EQ(std::count(sums.out.begin(), sums.out.end(), '\n'), 25);
  EXPECT_TRUE(sums.out.starts_with("0 96x80 ")) << sums.out;
  for (const std::string& file : {mp4, fragments}) {
    EXPECT_EQ(runTool({"decode", file, "-o", "-", "--format", "hash"}).out, sums.out) << file;
  }
  EXPECT_EQ(runTool({"decode", "-", "-o", "-", "--format", "hash"}, {.in = stream}).out, sums.out);
  EXPECT_EQ(report({"decode", mp4})["fps"], 12.5);
  // The way through the media libraries gives the same pictures as the device's decoder.
  const std::string decoded = directory.file("decoded.y4m");
  report({"decode", mp4, "-o", decoded});
  const json same = report({"compare", mp4, decoded});
  EXPECT_EQ(same["frames_compared"], 25);
  EXPECT_EQ(same["psnr_y"], 100);
  EXPECT_EQ(same["ssim_y"], 1);

  const std::string content = contentOf(mp4);
  const std::string cut = directory.write("cut.mp4", content.substr(0, content.size() / 2));
  for (const char* const command : {"call", "decode", "encode"}) {
    const Ended run = runTool({command, cut});
    EXPECT_EQ(run.exitCode, kInput) << command;
    EXPECT_TRUE(contains(run.err, "cut.mp4")) << run.err;
  }
}

TEST(VideoCommands, WritePngPicturesByNumber) {
  const TemporaryDirectory directory;
  report({"convert", "-s", "64x48", "-n", "3", "-o", directory.file("p-%03d.png")});
  EXPECT_EQ(directory.names().size(), 3U);
  // What comes back from RGB differs by its rounding.
  const std::string original = directory.file("original.y4m");
  report({"convert", "-s", "64x48", "-n", "3", "-o", original});
  const json difference = report({"compare", directory.file("p-000.png"), original});
  EXPECT_EQ(difference["frames_only_in_second"], 2);
  EXPECT_GT(difference["psnr_y"], 35);
  const Ended run = runTool({"convert", "-n", "2", "-o", directory.file("one.png")});
  EXPECT_EQ(run.exitCode, kOutput);
  EXPECT_TRUE(contains(run.err, "frame-%04d.png")) << run.err;
}

TEST(VideoCommands, ConvertThereAndBack) {
  const TemporaryDirectory directory;
  const std::string original = directory.file("a.y4m");
  report({"convert", "-s", "96x64", "-n", "2", "-o", original});
  const std::string raw = directory.file("a.raw");
  for (const char* const layout : {"yv12", "nv12", "nv21", "yuy2", "uyvy"}) {
    report({"convert", original, "--to", layout, "-o", raw});
    const std::string back = directory.file("back.y4m");
    report({"convert", raw, "-s", "96x64", "--from", layout, "-o", back});
    const json difference = report({"compare", original, back});
    EXPECT_EQ(difference["psnr_y"], 100) << layout;
    EXPECT_GT(difference["psnr_u"], 30) << layout;
  }
  const std::string turned = directory.file("turned.y4m");
  const json sizes = report({"convert", original, "--rotate", "90", "--pad", "96x128", "-o", turned});
  EXPECT_EQ(sizes["width"], 96);
  EXPECT_EQ(sizes["height"], 128);
  const std::string back = directory.file("back.y4m"), link = directory.file("link.y4m");
  std::filesystem::create_symlink("back.y4m", link);
  report({"convert", turned, "--cut", "64x96", "--rotate", "270", "-o", link});
  EXPECT_TRUE(contentOf(back) == contentOf(original));
  EXPECT_TRUE(std::filesystem::is_symlink(link));
  report({"convert", original, "--scale", "192x128", "-o", turned});
  report({"convert", turned, "--scale", "96x64", "-o", back});
  EXPECT_GT(report({"compare", original, back})["ssim_y"], 0.75);
}

TEST(Difference, IsMeasuredInTheUsualWay) {
  using Plane = std::vector<uint8_t>;
  EXPECT_EQ(psnr(Plane(1000, 9), Plane(1000, 9)), kBestPsnr);
  // Longer than what is summed up at once.
  EXPECT_NEAR(psnr(Plane(100'000, 7), Plane(100'000, 6)), 48.1308, 1e-4);
  // Flat planes: the luminance term alone, (2ab + c) / (aa + bb + c).
  EXPECT_NEAR(ssim(Plane(64, 100), Plane(64, 120), {8, 8}), 24006.5025 / 24406.5025, 1e-9);
}

TEST(DeviceLayout, RefusesPicturesThatCannotBe) {
  constexpr uint32_t kHuge = 0xFFFFFFFE;
  const DECODEDDATAINFO cases[] = {{0, 2, DECODED_DATA_NATIVE, 0, 0, 0, 0},
                                   {4, 4, DECODED_DATA_NATIVE, 0, 0, 0, 0},  // more than there is
                                   {kHuge, kHuge, DECODED_DATA_NATIVE, 0, 0, 0, 0},
                                   {4, 2, DECODED_DATA_RGB565, 0, 0, 0, 0},
                                   {4, 2, DECODED_DATA_CROPPED, 6, 2, 0, 0},
                                   {4, 2, DECODED_DATA_CROPPED, 4, 2, kHuge, 0},
                                   {4, 2, DECODED_DATA_CROPPED, kHuge, kHuge, 4, 4}};
  Picture picture;
  for (const DECODEDDATAINFO& info : cases)
    EXPECT_TRUE(DecodedPictureReader().read(info, std::vector<uint8_t>(12), picture)) << &info - cases;
}

}  // namespace
