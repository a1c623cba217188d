// What the options of several commands have in common. For the files of this folder.
#pragma once

#include <CLI/CLI.hpp>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "tools/base/units.h"
#include "tools/options/options.h"

namespace tool {

extern const char* const kExitCodes;

// An option whose text a parse function turns into a value. `form` stands in the help, `accepted` in the
// complaint. Given several times, the last one counts.
template <typename Value>
CLI::Option* addParsed(CLI::App& app, const std::string& names, const std::string& form,
                       const std::string& accepted, std::optional<Value> (*parse)(std::string_view),
                       std::function<void(Value)> store, const std::string& help) {
  const auto take = [names, accepted, parse, store](const std::string& text) {
    const auto value = parse(text);
    if (!value) throw CLI::ValidationError(names, "\"" + text + "\" is not " + accepted);
    store(*value);
  };
  return app.add_option_function<std::string>(names, take, help)->type_name(form)->take_last();
}

template <uint64_t low, uint64_t high>
std::optional<uint64_t> parseCountWithin(std::string_view text) {
  const auto count = parseCount(text);
  return count && *count >= low && *count <= high ? count : std::nullopt;
}

void addText(CLI::App& app, const std::string& names, std::string& text, const std::string& form,
             const std::string& help);
void addChoice(CLI::App& app, const std::string& name, std::string& chosen,
               const std::vector<std::string>& choices, const std::string& help);
void addSize(CLI::App& app, const std::string& names, std::optional<Size>& size, const std::string& help);
void addEvenSize(CLI::App& app, const std::string& names, std::optional<Size>& size, const std::string& help);
void addFrameRate(CLI::App& app, std::optional<FrameRate>& rate, const std::string& help);
void addFrameLimit(CLI::App& app, uint64_t& limit, const std::string& help);
// Size, rate and path of a source that may be raw.
void addSource(CLI::App& app, SourceRequest& source, const std::string& inputHelp);
void addPictureOutput(CLI::App& app, std::string& path, std::string& format);

// Entropy coding and transform follow the profile unless they are asked for.
struct CodingOptions {
  std::string entropy;
  void apply(EncoderSettings& encoder) const;
};
void addSender(CLI::App& app, SenderSettings& sender, CodingOptions& coding);

// The commands; `coding` has to be applied when all has been parsed.
void addCall(CLI::App& app, Options& options, CodingOptions& coding);
void addEncode(CLI::App& app, Options& options, CodingOptions& coding);
void addDecode(CLI::App& app, Options& options);
void addConvert(CLI::App& app, Options& options);
void addCompare(CLI::App& app, Options& options);

}  // namespace tool
