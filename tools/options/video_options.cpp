#include "tools/media/stream_writer.h"
#include "tools/options/fields.h"
#include "tools/video/layout.h"

namespace tool {

namespace {

constexpr const char* kEncodeFooter =
    "INPUT is any video file, Y4M, raw I420 (with --size), or - for standard input; without it a built-in\n"
    "scene is used.\n\n"
    "Examples:\n"
    "  omxbridge encode clip.webm -o clip.mp4 -b 2M\n"
    "  omxbridge encode clip.y4m -o - | ffmpeg -f h264 -i - -c copy clip.mkv\n"
    "  omxbridge encode -n 100 -o - --format mp4 | mpv -\n\n";

constexpr const char* kDecodeFooter =
    "INPUT is an H.264 byte stream (Annex B) or any file with H.264 video in it.\n\n"
    "Examples:\n"
    "  omxbridge decode clip.mp4 -o decoded.y4m\n"
    "  omxbridge decode coded.264 -o frame-%04d.png\n"
    "  omxbridge decode clip.mkv -o - --format hash\n"
    "  ffmpeg -i clip.mp4 -c copy -f h264 - | omxbridge decode - -o - | mpv -\n\n";

constexpr const char* kConvertFooter =
    "Pictures are cut, scaled, turned and padded, in this order. Cutting and padding keep the middle.\n\n"
    "Examples:\n"
    "  omxbridge convert clip.y4m -o small.y4m --scale 320x240\n"
    "  omxbridge convert clip.y4m -o clip.rgb --format raw --to rgb565\n"
    "  omxbridge convert clip.nv12 --size 640x480 --from nv12 --rotate 90 -o turned.y4m\n"
    "  omxbridge convert clip.mp4 -n 1 -o first.png\n"
    "  ffmpeg -i clip.mp4 -pix_fmt yuv420p -f yuv4mpegpipe - | omxbridge convert - --pad 1280x720 -o - | mpv "
    "-\n\n";

constexpr const char* kCompareFooter =
    "Both are any video files, Y4M, or raw I420 (with --size); one of them may be - for standard input.\n\n"
    "Examples:\n"
    "  omxbridge compare clip.y4m decoded.y4m\n"
    "  omxbridge compare clip.y4m decoded.y4m --json | python3 -m json.tool\n"
    "  ffmpeg -i coded.mp4 -pix_fmt yuv420p -f yuv4mpegpipe - | omxbridge compare clip.y4m - "
    "--per-picture\n\n";

std::optional<int> parseRotation(std::string_view text) {
  const auto degrees = parseCount(text);
  if (!degrees || *degrees % 90 != 0 || *degrees > 270) return std::nullopt;
  return static_cast<int>(*degrees);
}

}  // namespace

void addEncode(CLI::App& app, Options& options, CodingOptions& coding) {
  app.footer(std::string(kEncodeFooter) + kExitCodes);
  addSource(app, options.source, "Video file, raw I420, or -");
  addSender(app, options.encode.sender, coding);
  addText(app, "-o,--output", options.encode.path, "FILE", "Write the stream here; - for standard output");
  addChoice(app, "--format", options.encode.format, streamFormats(),
            "Byte stream (Annex B) or MP4 (default: by the file's name, or h264)");
}

void addDecode(CLI::App& app, Options& options) {
  app.footer(std::string(kDecodeFooter) + kExitCodes);
  app.add_option("INPUT", options.decodeInput, "H.264 byte stream, video file, or -")
      ->required()
      ->type_name("");
  addPictureOutput(app, options.decode.picturesPath, options.decode.picturesFormat);
  addFrameRate(app, options.decode.rate,
               "Frames a second to write into the file (default: what the stream says, or 30)");
}

void addConvert(CLI::App& app, Options& options) {
  app.footer(std::string(kConvertFooter) + kExitCodes);
  addSource(app, options.source, "Video file, raw pictures, or -");
  addChoice(app, "--from", options.source.layout, readableLayouts(), "Layout of raw input (default i420)");
  ConvertSettings& convert = options.convert;
  addEvenSize(app, "--cut", convert.cut, "Cut the middle out");
  addEvenSize(app, "--scale", convert.scale, "Scale to this size");
  addParsed<int>(
      app, "--rotate", "DEGREES", "0, 90, 180 or 270", parseRotation,
      [&convert](int degrees) { convert.rotation = degrees; }, "Turn clockwise by 90, 180 or 270");
  addEvenSize(app, "--pad", convert.pad, "Put into the middle of a black picture of this size");
  addChoice(app, "--to", convert.layout, writableLayouts(), "Layout of raw output (default i420)");
  addFrameLimit(app, convert.frameLimit, "End after this many pictures (default: all; 300 of the scene)");
  addPictureOutput(app, convert.path, convert.format);
}

void addCompare(CLI::App& app, Options& options) {
  app.footer(std::string(kCompareFooter) + kExitCodes);
  app.add_option("FIRST", options.source.path, "Video file, raw I420, or -")->required()->type_name("");
  app.add_option("SECOND", options.secondSource.path, "What to compare it with")->required()->type_name("");
  addSize(app, "-s,--size", options.source.size, "Picture size of raw files");
  app.add_flag("--per-picture", options.perPicture, "Print a line for each picture as well");
}

}  // namespace tool
