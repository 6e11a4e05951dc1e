// ulvetta: renders audio files through the reverb core and manages user presets from the command line.
// A thin host: it configures a ReverbCore in a fixed order, streams audio through it and reports every
// problem as one sentence on stderr with a non-zero exit status, leaving no partial output behind.
#include <unistd.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <iostream>
#include <string>

#include "AudioInput.h"
#include "CliSetup.h"
#include "IrCommand.h"
#include "Lv2Export.h"
#include "ParamsReport.h"
#include "Render.h"
#include "SkinSheet.h"
#include "Snapshot.h"
#include "filter/ReverbCore.h"
#include "presets/PresetFile.h"

namespace ulvetta {
namespace {

// Replaces an existing preset only with --force, or when the user answers yes on a terminal.
class CliOverwrite : public OverwriteQuestion {
public:
    explicit CliOverwrite(bool force) : force_(force) {}
    bool confirmOverwrite(const std::string& name, const std::string& path) override {
        if (force_) return true;
        if (::isatty(STDIN_FILENO) != 1 || ::isatty(STDERR_FILENO) != 1) {
            throw CliError("the preset \"" + name + "\" already exists (" + path + "); give --force to replace it");
        }
        std::fprintf(stderr, "The preset \"%s\" already exists. Replace it? [y/N] ", name.c_str());
        std::fflush(stderr);
        std::string answer;
        std::getline(std::cin, answer);
        if (!answer.empty() && (answer[0] == 'y' || answer[0] == 'Y')) return true;
        throw CliError("the preset \"" + name + "\" was kept unchanged", kExitFailure);
    }

private:
    bool force_;
};

void failOnPreset(PresetResult r, const std::string& name, const PresetFolder& folder) {
    switch (r) {
        case PresetResult::Ok: return;
        case PresetResult::BadName: throw CliError(presetNameProblem(name));
        case PresetResult::NotFound:
            throw CliError("there is no preset \"" + name + "\" in " + folder.directory());
        case PresetResult::Invalid:
            throw CliError("\"" + folder.pathOf(name) + "\" is not a preset file (one 88-byte settings record)");
        case PresetResult::Declined: throw CliError("the preset \"" + name + "\" was kept unchanged", kExitFailure);
        case PresetResult::IoError:
            throw CliError("the preset file \"" + folder.pathOf(name) + "\" could not be written or removed",
                           kExitFailure);
    }
}

int run(int argc, char** argv) {
    CLI::App app{"Ulvetta reverb: renders audio files through the reverb and manages user presets."};
    app.require_subcommand(1);

    // render IN OUT
    auto* render = app.add_subcommand("render", "Render an audio file through the reverb, tail included");
    RenderRequest request;
    CoreSetup renderSetup;
    std::string blockText = std::to_string(kDefaultBlockFrames);
    render->add_option("IN", request.input, "Input audio file (mono or stereo)")->required();
    render->add_option("OUT", request.output, "Output file (WAV unless its extension names AIFF, CAF, W64, RF64 or AU)")
        ->required();
    renderSetup.attach(*render);
    render->add_option("--block", blockText, "Frames per processing block, 1 to " + std::to_string(kMaxBlockFrames))
        ->type_name("FRAMES");
    render->add_flag("--float", request.forceFloat, "Write 32-bit float even for 16-bit input");
    std::string tailDbText;
    auto* tailDb = render->add_option("--tail-db", tailDbText,
                                      "End the tail once the output has stayed below DB dBFS for a second")
                       ->type_name("DB");

    // params
    auto* params = app.add_subcommand("params", "Show the 17 parameters after the same set-up as render");
    CoreSetup paramsSetup;
    bool json = false;
    paramsSetup.attach(*params);
    params->add_flag("--json", json, "Print a JSON array for scripts");

    // presets
    auto* presets = app.add_subcommand("presets", "List, show, save and delete user presets (.stp files)");
    presets->require_subcommand(1);
    std::string dir;
    presets->add_option("--dir", dir, "Preset folder (default $XDG_DATA_HOME/ulvetta/Presets)")->type_name("DIR");
    auto* list = presets->add_subcommand("list", "List the valid presets in the folder");
    auto* factory = presets->add_subcommand("factory", "List the factory presets with their numbers");
    std::string name;
    auto* show = presets->add_subcommand("show", "Show a preset's 17 values");
    show->add_option("NAME", name, "Preset name")->required();
    auto* save = presets->add_subcommand("save", "Save the settings given by the options as a preset");
    save->add_option("NAME", name, "Preset name")->required();
    CoreSetup saveSetup;
    saveSetup.attach(*save);
    bool force = false;
    save->add_flag("--force", force, "Replace an existing preset without asking");
    auto* remove = presets->add_subcommand("delete", "Delete a preset");
    remove->add_option("NAME", name, "Preset name")->required();
    auto* exportLv2 = presets->add_subcommand("export-lv2", "Write the presets as an LV2 preset bundle for the plugin");
    std::string bundle;
    exportLv2->add_option("BUNDLE", bundle, "Bundle folder (default ~/.lv2/ulvetta-presets.lv2)")->type_name("DIR");
    for (CLI::App* sub : {list, factory, show, save, remove, exportLv2}) sub->fallthrough();

    // ir
    auto* ir = app.add_subcommand(
        "ir", "Describe the stored impulse responses, or export the response an algorithm prepares (OUT.wav)");
    CoreSetup irSetup;
    irSetup.attach(*ir);
    std::string irOut;
    std::string irRate = "44100";
    ir->add_option("OUT", irOut, "Write the prepared response of --algorithm 3, 4 or 5 here as a float WAV");
    ir->add_option("--rate", irRate, "Stream rate in Hz for the export (default 44100)")->type_name("HZ");

    // skin
    auto* skin = app.add_subcommand("skin", "Draw a review sheet of the editor's bitmaps and fonts (OUT.png)");
    std::string skinOut;
    skin->add_option("OUT", skinOut, "The PNG file to write")->required();

    // snapshot
    auto* snapshot = app.add_subcommand("snapshot", "Draw a page of the editor, after scripted events, as OUT.png");
    SnapshotCommand snapshotCommand;
    snapshotCommand.attach(*snapshot);

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& e) {
        if (e.get_exit_code() == 0) return app.exit(e);
        std::string message = e.what();
        // Sentence case inside our "ulvetta: ..." line, but names such as OUT keep their capitals.
        if (message.size() > 1 && std::islower(static_cast<unsigned char>(message[1])))
            message[0] = static_cast<char>(std::tolower(static_cast<unsigned char>(message[0])));
        throw CliError(message + " (see ulvetta --help)");
    }

    if (render->parsed()) {
        long long block = 0;
        if (!parseInteger(blockText, 1, kMaxBlockFrames, block))
            throw CliError("--block takes a whole number of frames from 1 to " + std::to_string(kMaxBlockFrames) +
                           ", not \"" + blockText + "\"");
        request.blockFrames = static_cast<int>(block);
        if (tailDb->count() > 0) request.tailDb = parseTailDb(tailDbText);
        renderSetup.collect(*render);
        ReverbCore core;
        renderSetup.apply(core);
        installInterruptHandlers();
        ulvetta::render(core, request, true);
        return kExitOk;
    }
    if (params->parsed()) {
        paramsSetup.collect(*params);
        ReverbCore core;
        paramsSetup.apply(core);
        std::fputs((json ? paramsJson(core) : paramsTable(core)).c_str(), stdout);
        return kExitOk;
    }

    if (ir->parsed()) {
        if (irOut.empty()) {
            std::fputs(storedResponsesReport().c_str(), stdout);
            return kExitOk;
        }
        long long rate = 0;
        if (!parseInteger(irRate, kMinSampleRate, kMaxSampleRate, rate))
            throw CliError("--rate takes a sample rate from " + std::to_string(kMinSampleRate) + " to " +
                           std::to_string(kMaxSampleRate) + " Hz, not \"" + irRate + "\"");
        irSetup.collect(*ir);
        ReverbCore core;
        irSetup.apply(core);
        exportResponse(core, static_cast<int>(rate), irOut);
        return kExitOk;
    }

    if (skin->parsed()) {
        writeSkinSheet(skinOut);
        return kExitOk;
    }
    if (snapshot->parsed()) {
        snapshotCommand.run(*snapshot);
        return kExitOk;
    }

    if (factory->parsed()) {
        for (int i = 0; i < kAlgorithmCount; ++i) std::printf("%d\t%s\n", i, kAlgorithmNames[i]);
        return kExitOk;
    }
    const PresetFolder folder(dir.empty() ? defaultPresetDirectory() : dir);
    if (exportLv2->parsed()) {
        const std::string target = bundle.empty() ? defaultLv2PresetBundle() : bundle;
        const int count = exportLv2Presets(folder, target);
        std::printf("%d preset%s written to %s\n", count, count == 1 ? "" : "s", target.c_str());
        return kExitOk;
    }
    if (list->parsed()) {
        std::vector<std::string> names = folder.list();
        std::sort(names.begin(), names.end());
        for (const std::string& n : names) std::printf("%s\n", n.c_str());
        return kExitOk;
    }
    if (show->parsed()) {
        ReverbCore core;
        failOnPreset(folder.load(name, core), name, folder);
        std::fputs(presetValues(core).c_str(), stdout);
        return kExitOk;
    }
    if (save->parsed()) {
        if (!presetNameProblem(name).empty()) throw CliError(presetNameProblem(name));
        saveSetup.collect(*save);
        ReverbCore core;
        saveSetup.apply(core);
        CliOverwrite ask(force);
        failOnPreset(folder.save(name, core, ask), name, folder);
        std::printf("saved %s\n", folder.pathOf(name).c_str());
        return kExitOk;
    }
    if (!presetNameProblem(name).empty()) throw CliError(presetNameProblem(name));
    std::error_code missing;
    if (!std::filesystem::is_regular_file(folder.pathOf(name), missing))
        failOnPreset(PresetResult::NotFound, name, folder);
    failOnPreset(folder.remove(name), name, folder);
    return kExitOk;
}

}  // namespace
}  // namespace ulvetta

int main(int argc, char** argv) {
    try {
        return ulvetta::run(argc, argv);
    } catch (const ulvetta::CliError& e) {
        std::fprintf(stderr, "ulvetta: %s.\n", e.what());
        return e.status();
    } catch (const std::exception& e) {
        std::fprintf(stderr, "ulvetta: unexpected failure: %s.\n", e.what());
        return ulvetta::kExitFailure;
    }
}
