// bash and zsh share the part that finds out what may stand at the cursor: it is
// written in what both understand. fish has one line for each word that it offers.

#include "host/cli/Completion.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <string_view>
#include <vector>

#include "host/cli/CommandTable.h"
#include "host/cli/Words.h"
#include "host/settings/SettingCatalogue.h"
#include "target/simulated/DeviceOptions.h"

namespace host {

namespace {

/// What a shell offers for a value: words, and whether files as well.
struct Offer {
    std::vector<std::string> words;
    bool files = false;
};

Offer OfferFor(const OptionRow& row) {
    Offer offer{row.choices, row.offers == Offers::Files};
    if (row.offers == Offers::Devices) offer.words = target::DeviceClassNames();
    const bool assignments = row.offers == Offers::SettingAssignments;
    if (assignments || row.offers == Offers::Settings)
        for (const SettingInfo& info : SettingCatalogue())
            if (!assignments || info.form != SettingForm::Published)
                offer.words.push_back(info.key + std::string(assignments ? "=" : ""));
    return offer;
}

/// All options of the tool, each once: several commands share some of them.
std::vector<OptionRow> OptionsWithValue(const CommandRows& commands) {
    std::vector<OptionRow> all;
    const auto add = [&](const std::vector<OptionRow>& rows) {
        for (const OptionRow& row : rows) {
            bool known = row.IsArgument() || row.IsSwitch();
            for (const OptionRow& other : all)
                known = known || std::string_view(other.names) == row.names;
            if (!known) all.push_back(row);
        }
    };
    add(GlobalOptions());
    for (const CommandRow& command : commands)
        add(command.options);
    return all;
}

std::string Assignments(const Offer& offer) {
    return fmt::format("values='{}'{}", fmt::join(offer.words, " "),
                       offer.files ? "; files=1" : "");
}

/// What may follow a command: its options, and what its arguments take.
Offer OfferAfter(const CommandRow& command) {
    Offer offer;
    for (const OptionRow& row : command.options) {
        const Offer argument = row.IsArgument() ? OfferFor(row) : Offer{SplitNames(row), false};
        offer.words.insert(offer.words.end(), argument.words.begin(), argument.words.end());
        offer.files = offer.files || argument.files;
    }
    offer.words.emplace_back("--help");
    return offer;
}

/// The words before the cursor that name the command, in shell patterns: 'mac read' and its like.
std::string CommandPatterns(const CommandRows& commands) {
    std::vector<std::string> patterns;
    for (const std::string& word : FirstWords(commands))
        patterns.push_back("' " + word + "'");
    for (const CommandRow& command : commands)
        if (std::string_view(command.name).find(' ') != std::string_view::npos)
            patterns.push_back(fmt::format("'{}'", command.name));
    return fmt::format("{}", fmt::join(patterns, "|"));
}

std::string SharedBody(const CommandRows& commands) {
    std::vector<std::string> valued;
    std::string values;
    for (const OptionRow& row : OptionsWithValue(commands)) {
        valued.emplace_back(row.names);
        values += fmt::format("    {}) {} ;;\n", row.names, Assignments(OfferFor(row)));
    }
    Offer first{FirstWords(commands), false};
    for (const OptionRow& row : GlobalOptions())
        for (const std::string& name : SplitNames(row))
            first.words.push_back(name);
    std::string cases = fmt::format("      '') {} ;;\n", Assignments(first));
    for (const std::string& word : FirstWords(commands))
        if (const auto second = SecondWords(commands, word); !second.empty())
            cases += fmt::format("      '{}') {} ;;\n", word, Assignments({second, false}));
    for (const CommandRow& command : commands)
        cases += fmt::format("      '{}') {} ;;\n", command.name, Assignments(OfferAfter(command)));
    return fmt::format(
        "  local word='' skip='' command='' values='' files='' option=''\n"
        "  for word in \"${{preceding[@]}}\"; do\n"
        "    if [ -n \"$skip\" ]; then skip=''; continue; fi\n"
        "    case \"$word\" in\n"
        "      {0}) skip=1 ;;\n"
        "      -*) ;;\n"
        "      *) case \"$command $word\" in {1}) command=\"${{command:+$command }}$word\" ;; esac "
        ";;\n"
        "    esac\n"
        "  done\n"
        "  case \"$previous\" in\n{2}"
        "    *) case \"$command\" in\n{3}      esac ;;\n"
        "  esac\n"
        "  case \"$previous:$current\" in\n"
        "    --sim:*,*) values=''\n"
        "      for option in {4}; do values=\"$values ${{current%,*}},$option=\"; done ;;\n"
        "  esac\n",
        fmt::join(valued, "|"), CommandPatterns(commands), values, cases,
        fmt::join(target::DeviceOptionNames(), " "));
}

std::string BashScript(const CommandRows& commands) {
    return "# bash completion for corvane-flash; generated by 'corvane-flash completion bash'\n"
           "_corvane_flash() {\n"
           "  local current=\"${COMP_WORDS[COMP_CWORD]}\" "
           "previous=\"${COMP_WORDS[COMP_CWORD-1]}\"\n"
           "  local preceding=(\"${COMP_WORDS[@]:1:COMP_CWORD-1}\")\n" +
           SharedBody(commands) +
           "  mapfile -t COMPREPLY < <(compgen -W \"$values\" -- \"$current\")\n"
           "  if [ -n \"$files\" ]; then\n"
           "    compopt -o filenames\n"
           "    mapfile -t -O \"${#COMPREPLY[@]}\" COMPREPLY < <(compgen -f -- \"$current\")\n"
           "  fi\n"
           "  case \"${COMPREPLY[0]}\" in *=) compopt -o nospace ;; esac\n"
           "}\n"
           "complete -F _corvane_flash corvane-flash\n";
}

std::string ZshScript(const CommandRows& commands) {
    return "#compdef corvane-flash\n"
           "# zsh completion for corvane-flash; generated by 'corvane-flash completion zsh'\n"
           "_corvane_flash() {\n"
           "  local current=\"$words[CURRENT]\" previous=\"$words[CURRENT-1]\"\n"
           "  local -a preceding=(\"${(@)words[2,CURRENT-1]}\") all=()\n" +
           SharedBody(commands) +
           "  all=(${=values})\n"
           "  compadd -- ${all:#*=}\n"
           "  compadd -S '' -- ${(M)all:#*=}\n"
           "  [ -n \"$files\" ] && _files\n"
           "  return 0\n"
           "}\n"
           "if [ \"$funcstack[1]\" = _corvane_flash ]; then _corvane_flash \"$@\"\n"
           "else compdef _corvane_flash corvane-flash; fi\n";
}

std::string FishQuoted(std::string_view text) {
    std::string quoted;
    for (const char c : text)
        quoted += c == '\'' || c == '\\' ? std::string{'\\', c} : std::string{c};
    return "'" + quoted + "'";
}

/// When a line of fish's applies: behind the words of this command, and no other's.
std::string FishCondition(const CommandRow& command) {
    const std::string name = command.name;
    const auto blank = name.find(' ');
    const std::string seen = "__fish_seen_subcommand_from ";
    if (blank == std::string::npos) return seen + name + "; and not " + seen + "mac register";
    return seen + name.substr(0, blank) + "; and " + seen + name.substr(blank + 1);
}

std::string FishLine(const std::string& condition, const OptionRow& row) {
    const Offer offer = OfferFor(row);
    std::string line = "complete -c corvane-flash";
    if (!condition.empty()) line += " -n " + FishQuoted(condition);
    if (!row.IsArgument())
        for (const std::string& name : SplitNames(row))
            line += name.starts_with("--") ? " -l " + name.substr(2) : " -s " + name.substr(1);
    if (offer.files)
        line += row.IsArgument() ? " -F" : " -r -F";
    else if (!row.IsArgument() && !row.IsSwitch())
        line += " -x";
    if (!offer.words.empty())
        line += fmt::format(" -a {}", FishQuoted(fmt::format("{}", fmt::join(offer.words, " "))));
    return line + " -d " + FishQuoted(row.help) + "\n";
}

std::string FishScript(const CommandRows& commands) {
    std::string script =
        "# fish completion for corvane-flash; generated by 'corvane-flash completion fish'\n"
        "complete -c corvane-flash -f\n";
    for (const OptionRow& row : GlobalOptions())
        script += FishLine("", row);
    for (const std::string& word : FirstWords(commands)) {
        script += fmt::format("complete -c corvane-flash -n __fish_use_subcommand -a {} -d {}\n",
                              word, FishQuoted(FirstWordHelp(commands, word)));
        if (const auto second = SecondWords(commands, word); !second.empty())
            script += fmt::format(
                "complete -c corvane-flash -n '__fish_seen_subcommand_from {}; and not "
                "__fish_seen_subcommand_from {}' -a '{}'\n",
                word, fmt::join(second, " "), fmt::join(second, " "));
    }
    for (const CommandRow& command : commands)
        for (const OptionRow& row : command.options)
            script += FishLine(FishCondition(command), row);
    return script;
}

}  // namespace

std::string CompletionScript(const CommandRows& commands, const std::string& shell) {
    if (shell == "bash") return BashScript(commands);
    return shell == "zsh" ? ZshScript(commands) : FishScript(commands);
}

}  // namespace host
