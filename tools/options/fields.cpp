#include "tools/options/fields.h"

#include "tools/files/picture_writer.h"
#include "tools/video/picture.h"

namespace tool {

namespace {

constexpr int kBaseline = 66;
constexpr int kMain = 77;
constexpr int kHigh = 100;

constexpr uint64_t kMostFrames = uint64_t{1} << 40;

std::optional<int> parseProfile(std::string_view name) {
  if (name == "baseline") return kBaseline;
  if (name == "main") return kMain;
  if (name == "high") return kHigh;
  return std::nullopt;
}

std::optional<Size> parseEvenSize(std::string_view text) {
  const auto size = parseSize(text);
  return size && isEven(*size) ? size : std::nullopt;
}

}  // namespace

const char* const kExitCodes =
    "Exit codes:\n"
    "  0    done\n"
    "  1    a session failed while it ran\n"
    "  2    wrong command line\n"
    "  3    the input cannot be read, is not what it should be, or breaks off\n"
    "  4    an output cannot be written\n"
    "  5    the device has no such component, or it refuses the settings\n"
    "  130  interrupted; what was done until then has been written\n";

void addText(CLI::App& app, const std::string& names, std::string& text, const std::string& form,
             const std::string& help) {
  app.add_option(names, text, help)->type_name(form)->take_last();
}

void addChoice(CLI::App& app, const std::string& name, std::string& chosen,
               const std::vector<std::string>& choices, const std::string& help) {
  std::string list;
  for (const std::string& choice : choices) list.append(list.empty() ? "" : "|").append(choice);
  app.add_option(name, chosen, help)
      ->check(CLI::IsMember(choices).description(""))
      ->type_name(list)
      ->take_last();
}

void addSize(CLI::App& app, const std::string& names, std::optional<Size>& size, const std::string& help) {
  addParsed<Size>(
      app, names, "WxH", "a size as 640x480, sides from 2 to 8192", parseSize,
      [&size](Size value) { size = value; }, help);
}

void addEvenSize(CLI::App& app, const std::string& names, std::optional<Size>& size,
                 const std::string& help) {
  addParsed<Size>(
      app, names, "WxH", "an even size as 640x480, sides from 2 to 8192", parseEvenSize,
      [&size](Size value) { size = value; }, help);
}

void addFrameRate(CLI::App& app, std::optional<FrameRate>& rate, const std::string& help) {
  addParsed<FrameRate>(
      app, "--fps", "RATE", "a rate up to 255, as 30, 29.97 or 30000/1001", parseFrameRate,
      [&rate](FrameRate value) { rate = value; }, help);
}

void addFrameLimit(CLI::App& app, uint64_t& limit, const std::string& help) {
  addParsed<uint64_t>(
      app, "-n,--frames", "COUNT", "a number from 1 on", parseCountWithin<1, kMostFrames>,
      [&limit](uint64_t count) { limit = count; }, help);
}

void addSource(CLI::App& app, SourceRequest& source, const std::string& inputHelp) {
  app.add_option("INPUT", source.path, inputHelp)->type_name("");
  addSize(app, "-s,--size", source.size,
          "Picture size of raw input and of the scene (default of the scene 640x480)");
  addFrameRate(app, source.rate,
               "Frames a second, as 30, 29.97 or 30000/1001 (default: the input's own, or 30)");
}

void addPictureOutput(CLI::App& app, std::string& path, std::string& format) {
  addText(app, "-o,--output", path, "FILE", "Write the pictures here; - for standard output");
  addChoice(app, "--format", format, pictureFormats(),
            "Format of the pictures: hash is an MD5 sum for each (default: by the file's name, or y4m)");
}

void CodingOptions::apply(EncoderSettings& encoder) const {
  encoder.arithmeticCoding = entropy.empty() ? encoder.profile != kBaseline : entropy == "cabac";
  encoder.largeTransform = encoder.profile == kHigh;
}

void addSender(CLI::App& app, SenderSettings& sender, CodingOptions& coding) {
  EncoderSettings& encoder = sender.encoder;
  addFrameLimit(app, sender.frameLimit,
                "End after this many frames of the input (default: all; 300 of the scene)");
  addParsed<uint32_t>(
      app, "-b,--bitrate", "RATE", "a rate from 1k to 1000M, as 800k or 1.5M", parseBitRate,
      [&encoder](uint32_t rate) { encoder.bitRate = rate; }, "Bits a second, as 800k or 1.5M (default 1M)");
  addParsed<int>(
      app, "-p,--profile", "baseline|main|high", "baseline, main or high", parseProfile,
      [&encoder](int profile) { encoder.profile = profile; }, "H.264 profile (default baseline)");
  addParsed<uint64_t>(
      app, "-k,--key-interval", "COUNT", "a number from 0 to 100000", parseCountWithin<0, 100000>,
      [&encoder](uint64_t count) { encoder.keyInterval = static_cast<int>(count); },
      "Frames from one key frame to the next; 0: only the first is one (default 150)");
  addParsed<uint64_t>(
      app, "--refs", "COUNT", "a number from 1 to 16", parseCountWithin<1, 16>,
      [&encoder](uint64_t count) { encoder.references = static_cast<uint32_t>(count); },
      "Reference frames, up to 16 (default 1)");
  addChoice(app, "--entropy", coding.entropy, {"cavlc", "cabac"},
            "Entropy coding (default cavlc for baseline, cabac for the others)");
}

}  // namespace tool
