#include "tools/options/shell.h"

#include <algorithm>

#include "tools/options/fields.h"

namespace tool {

namespace {

std::vector<const CLI::App*> commandsOf(const CLI::App& app) {
  return app.get_subcommands([](const CLI::App*) { return true; });
}

std::vector<std::string> namesOf(const CLI::Option& option) {
  std::vector<std::string> names;
  for (const std::string& name : option.get_snames()) names.push_back("-" + name);
  for (const std::string& name : option.get_lnames()) names.push_back("--" + name);
  return names;
}

// The choices of options whose form lists them, as in "a|b|c"; empty for others.
std::string choicesOf(const CLI::Option& option) {
  std::string form = option.get_type_name();
  if (form.find('|') == std::string::npos) return {};
  std::replace(form.begin(), form.end(), '|', ' ');
  return form;
}

std::string joined(const std::vector<std::string>& words, const char* between) {
  std::string text;
  for (const std::string& word : words) text.append(text.empty() ? "" : between).append(word);
  return text;
}

// With a backslash before each of the letters.
std::string escaped(const std::string& text, std::string_view letters) {
  std::string result;
  for (const char letter : text) {
    if (letters.find(letter) != std::string_view::npos) result += '\\';
    result += letter;
  }
  return result;
}

std::string bashScript(const CLI::App& app) {
  std::vector<std::string> commands;
  std::string choices;
  std::string options;
  for (const CLI::App* const command : commandsOf(app)) {
    commands.push_back(command->get_name());
    std::vector<std::string> words;
    for (const CLI::Option* const option : command->get_options()) {
      const auto names = namesOf(*option);
      words.insert(words.end(), names.begin(), names.end());
      std::vector<std::string> patterns;
      for (const std::string& name : names) patterns.push_back(command->get_name() + ":" + name);
      const std::string list = choicesOf(*option);
      if (patterns.empty() && !list.empty())
        options += "    " + command->get_name() + ") files='" + list + "' ;;\n";
      if (patterns.empty() || list.empty()) continue;
      choices += "    " + joined(patterns, "|") + ") words='" + list + "' ;;\n";
    }
    choices +=
        "    " + command->get_name() + ":*) [[ $current == -* ]] && words='" + joined(words, " ") + "' ;;\n";
  }
  return "# Completion of omxbridge for bash: put it where bash-completion looks, or source it.\n"
         "_omxbridge() {\n"
         "  local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD-1]} words= files=\n"
         "  if ((COMP_CWORD == 1)); then\n"
         "    words='" +
         joined(commands, " ") +
         " --help --version'\n"
         "  else\n"
         "    case ${COMP_WORDS[1]}:$previous in\n" +
         choices +
         "    esac\n"
         "    case ${COMP_WORDS[1]} in\n" +
         options +
         "    esac\n"
         "    [[ $words ]] || words=$files\n"
         "  fi\n"
         "  if [[ $words ]]; then\n"
         "    mapfile -t COMPREPLY < <(compgen -W \"$words\" -- \"$current\")\n"
         "  else\n"
         "    mapfile -t COMPREPLY < <(compgen -f -- \"$current\")\n"
         "  fi\n"
         "}\n"
         "complete -o filenames -F _omxbridge omxbridge\n";
}

std::string zshArgument(const std::string& form, const std::string& choices) {
  if (!choices.empty()) return ":value:(" + choices + ")";
  return ":" + form + ":" + (form == "FILE" ? "_files" : "");
}

// For the inside of a word in single quotes.
std::string quoted(const std::string& text) {
  std::string result;
  for (const char letter : text) result += letter == '\'' ? std::string("'\\''") : std::string(1, letter);
  return result;
}

std::string zshOption(const CLI::Option& option) {
  const std::string help = quoted(escaped(option.get_description(), "[]:"));
  std::string arguments;
  if (option.get_items_expected_max() > 0) {
    const std::string form = option.get_type_name();
    const size_t blank = form.find(' ');
    arguments = zshArgument(form.substr(0, blank), choicesOf(option));
    if (blank != std::string::npos) arguments += zshArgument(form.substr(blank + 1), {});
  }
  std::string lines;
  for (const std::string& name : namesOf(option)) {
    lines += "        '*" + name + "[" + help + "]" + arguments + "' \\\n";
  }
  return lines;
}

std::string zshScript(const CLI::App& app) {
  std::string commands;
  std::string cases;
  for (const CLI::App* const command : commandsOf(app)) {
    commands += "    '" + command->get_name() + ":" + quoted(command->get_description()) + "'\n";
    cases += "    " + command->get_name() + ")\n      _arguments \\\n";
    std::string rest = "_files";
    for (const CLI::Option* const option : command->get_options()) {
      cases += zshOption(*option);
      if (option->get_positional() && !choicesOf(*option).empty()) rest = "(" + choicesOf(*option) + ")";
    }
    cases += "        '*:input:" + rest + "' ;;\n";
  }
  return "#compdef omxbridge\n"
         "# Completion of omxbridge for zsh: put it into a folder of $fpath as _omxbridge.\n"
         "local -a commands=(\n" +
         commands +
         ")\n"
         "if ((CURRENT == 2)); then\n"
         "  _describe command commands\n"
         "else\n"
         "  shift words\n"
         "  ((CURRENT--))\n"
         "  case $words[1] in\n" +
         cases +
         "  esac\n"
         "fi\n";
}

// Text that troff takes literally, line by line.
std::string roff(const std::string& text) {
  std::string result;
  bool lineBegins = true;
  for (const char letter : text) {
    if (lineBegins && (letter == '.' || letter == '\'')) result += "\\&";
    if (letter == '\\' || letter == '-') result += '\\';
    result += letter;
    lineBegins = letter == '\n';
  }
  return result;
}

// The part of a footer that is the command's own.
std::string ownFooter(const CLI::App& app) {
  std::string footer = app.get_footer();
  const size_t common = footer.find(kExitCodes);
  if (common != std::string::npos) footer.erase(common);
  while (footer.ends_with('\n')) footer.pop_back();
  return footer;
}

}  // namespace

std::string completionScript(const CLI::App& app, const std::string& shell) {
  return shell == "zsh" ? zshScript(app) : bashScript(app);
}

std::string manualPage(const CLI::App& app) {
  const auto literal = [](const std::string& text) { return ".PP\n.nf\n" + roff(text) + "\n.fi\n"; };
  std::string page = ".TH OMXBRIDGE 1\n.SH NAME\nomxbridge \\- " + roff(app.get_description()) +
                     "\n.SH SYNOPSIS\n.B omxbridge\n.I COMMAND\n[\\fIOPTION\\fR ...] [\\fIFILE\\fR ...]\n"
                     ".SH COMMANDS\n";
  for (const CLI::App* const command : commandsOf(app)) {
    page += ".SS " + command->get_name() + "\n" + roff(command->get_description()) + ".\n";
    for (const CLI::Option* const option : command->get_options()) {
      const std::string names = joined(namesOf(*option), ", ");
      page += ".TP\n\\fB" + roff(names.empty() ? option->get_name(true) : names) + "\\fR";
      if (option->get_items_expected_max() > 0 && !names.empty())
        page += " \\fI" + roff(option->get_type_name()) + "\\fR";
      page += "\n" + roff(option->get_description()) + ".\n";
    }
    if (const std::string footer = ownFooter(*command); !footer.empty()) page += literal(footer);
  }
  page += ".SH ENVIRONMENT\n" + literal(ownFooter(app)) + ".SH EXIT STATUS\n" + literal(kExitCodes);
  return page;
}

}  // namespace tool
