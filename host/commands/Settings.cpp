// corvane-flash settings: list them, show one, keep one. It needs neither plug-in nor target.

#include <fmt/format.h>

#include "host/commands/Command.h"
#include "host/commands/Commands.h"

namespace host::commands {

namespace {

struct SettingsOptions {
    std::optional<std::string> setting;  ///< KEY or KEY=TEXT
    std::optional<std::string> forget;
};

Json ToJson(const Context& context, const SettingInfo& info) {
    const auto [text, origin] = context.settings.Get(info.key);
    return {{"key", info.key},
            {"value", text},
            {"origin", OriginText(origin, context.settings.Paths())},
            {"meaning", info.meaning},
            {"accepts", AcceptedTexts(info)}};
}

void ShowOne(Context& context, const SettingInfo& info) {
    const auto [text, origin] = context.settings.Get(info.key);
    if (!context.reporter.Hears(Verbosity::Normal)) return context.reporter.Result(text);
    context.reporter.Result(fmt::format("{} = \"{}\"  ({})", info.key, text,
                                        OriginText(origin, context.settings.Paths())));
    context.reporter.Result(fmt::format("    {}; takes {}", info.meaning, AcceptedTexts(info)));
}

/// The options that weren't typed.
Json ListOptions(Context& context) {
    Json all = Json::array();
    for (const auto& [option, text, place] : context.options.placed) {
        context.reporter.Result(context.reporter.Hears(Verbosity::Normal)
                                    ? fmt::format("{} \"{}\"  ({})", option, text, place)
                                    : fmt::format("{} \"{}\"", option, text));
        all.push_back({{"option", option}, {"value", text}, {"origin", place}});
    }
    return all;
}

Outcome List(Context& context) {
    Json all = Json::array();
    for (const SettingInfo& info : SettingCatalogue()) {
        if (context.reporter.Hears(Verbosity::Normal))
            ShowOne(context, info);
        else
            context.reporter.Result(
                fmt::format("{} = \"{}\"", info.key, context.settings.Text(info.key)));
        all.push_back(ToJson(context, info));
    }
    const SettingPaths& paths = context.settings.Paths();
    const auto say = [&](const char* what, const std::string& file) {
        context.reporter.Say(Verbosity::Verbose, what + (file.empty() ? "none" : file));
    };
    say("Project file: ", paths.project);
    say("Your file: ", paths.user);
    say("Kept values: ", paths.kept);
    return {.result = {{"settings", all}, {"options", ListOptions(context)}}};
}

/// Keeping is what the command is for, so that it fails when nothing can be kept.
void Save(Context& context) {
    context.settings.Save(
        [&](const std::string& text) { context.reporter.Say(Verbosity::Normal, text); });
}

Outcome Keep(Context& context, const SettingInfo& info, const std::string& text) {
    const std::string checked = RequireText(info, text, "settings");
    if (IsOfOneBoard(info.key))
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("{} belongs to one board and isn't kept; name it with 'mac "
                                  "program' or 'register program', or for a run with --set",
                                  info.key));
    context.settings.Keep(info.key, checked);
    Save(context);
    const auto [now, origin] = context.settings.Get(info.key);
    ShowOne(context, info);
    if (origin < Origin::Kept)
        context.reporter.Say(Verbosity::Normal,
                             fmt::format("Kept \"{}\", but the value of the {} goes before it",
                                         checked, OriginText(origin, context.settings.Paths())));
    return {.result = ToJson(context, info)};
}

Outcome Forget(Context& context, const std::string& key) {
    const SettingInfo& info = RequireSetting(key, "settings");
    context.settings.Forget(info.key);
    Save(context);
    ShowOne(context, info);
    return {.result = ToJson(context, info)};
}

Outcome RunSettings(Context& context, const SettingsOptions& options) {
    if (options.forget && options.setting)
        throw Failure(ExitStatus::WrongUsage,
                      fmt::format("--forget {} and {} don't go together; name one of them",
                                  *options.forget, *options.setting));
    if (options.forget) return Forget(context, *options.forget);
    if (!options.setting) return List(context);
    const std::string& argument = *options.setting;
    const auto equals = argument.find('=');
    const SettingInfo& info = RequireSetting(argument.substr(0, equals), "settings");
    if (equals != std::string::npos) return Keep(context, info, argument.substr(equals + 1));
    ShowOne(context, info);
    return {.result = ToJson(context, info)};
}

}  // namespace

CommandRow Settings() {
    return Command<SettingsOptions>(
        {.name = "settings",
         .help = "List the settings, or show, keep or drop one",
         .details =
             "Each is shown with its origin, its meaning and the texts that it takes. A "
             "value comes from the first of: command line, environment variable "
             "CORVANE_SET_KEY, project file (corvane-flash.toml, in this folder or above it), "
             "your settings file, kept value (KEY=TEXT here, and what the "
             "plug-in publishes), default. With -q, only the values are shown.",
         .example = "  corvane-flash settings FlashTimeoutValue\n"
                    "  corvane-flash settings FlashCrystalFreq=10",
         .needs = Needs::Settings},
        {{&SettingsOptions::setting,
          {.names = "KEY",
           .help = "The setting to show; as KEY=TEXT, the setting to keep with this text",
           .offers = Offers::Settings}},
         {&SettingsOptions::forget,
          {"--forget", "KEY", "Drop the kept value of a setting", Offers::Settings}}},
        RunSettings);
}

}  // namespace host::commands
