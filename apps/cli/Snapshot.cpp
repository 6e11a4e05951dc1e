#include "Snapshot.h"

#include <unistd.h>

#include <CLI/CLI.hpp>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <memory>

#include "TempOutput.h"
#include "editor/EditorWindow.h"
#include "editor/PageSet.h"
#include "editor/headless/EventScript.h"
#include "editor/headless/HeadlessHost.h"
#include "editor/headless/PngPresenter.h"
#include "filter/CoreState.h"
#include "filter/ReverbCore.h"

namespace ulvetta {
namespace {

namespace fs = std::filesystem;

// A core that reports streaming at a fixed meter level, as getStatus does while audio runs.
class LevelCore : public ReverbCore {
public:
    explicit LevelCore(float level) : level_(level) {}
    float getStatus(int32_t code) override {
        if (code == kStatusLoad) return ReverbCore::getStatus(code);
        return code == kStatusStopped ? 0.0f : level_;
    }

private:
    float level_;
};

int pageIndex(const std::string& name) {
    if (name == "reverb") return kReverbPage;
    if (name == "filter") return kFilterPage;
    if (name == "about") return kAboutPage;
    throw CliError("--page takes reverb, filter or about, not " + inQuotes(name));
}

float parseLevel(const std::string& text) {
    const std::string t = trim(text);
    const double v = isDecimalNumber(t) ? std::strtod(t.c_str(), nullptr) : -1.0;
    if (!(v >= 0.0 && v <= 1.0)) throw CliError("--level takes a number from 0 to 1, not " + inQuotes(text));
    return static_cast<float>(v);
}

// The folder background pictures are looked up in: the profile's own, as the module's is on Windows.
std::string folderOf(const std::string& path) {
    const fs::path parent = fs::path(path).parent_path();
    return (parent.empty() ? std::string(".") : parent.string()) + "/";
}

std::string presetFolderOrNone() {
    try {
        return defaultPresetDirectory();
    } catch (const CliError&) {
        return {};
    }
}

void writeAll(int fd, const uint8_t* data, size_t size, const std::string& path) {
    while (size > 0) {
        const ssize_t n = ::write(fd, data, size);
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) {
            const std::string reason = std::strerror(errno);
            ::close(fd);
            throw CliError("cannot write " + inQuotes(path) + " (" + reason + ")", kExitFailure);
        }
        data += n;
        size -= static_cast<size_t>(n);
    }
    if (::close(fd) != 0)
        throw CliError("cannot write " + inQuotes(path) + " (" + std::strerror(errno) + ")", kExitFailure);
}

}  // namespace

void SnapshotCommand::attach(CLI::App& app) {
    app.add_option("--page", page_, "reverb, filter or about (default reverb)")->type_name("PAGE");
    setup_.attach(app);
    app.add_option("--profile", profile_, "Appearance file (.ini); without it the default colours show")
        ->type_name("FILE.ini");
    app.add_option("--events", events_, "Mouse, key and tick events to play before the picture is taken")
        ->type_name("FILE");
    app.add_option("--level", level_, "Show the meter needle at this level, 0 to 1, as while streaming")
        ->type_name("L");
    app.add_option("--save-state", saveState_, "Write the settings after the events as a .stp file")
        ->type_name("FILE.stp");
    app.add_option("OUT", output_, "The PNG file to write (750 x 167)")->required();
}

void SnapshotCommand::run(const CLI::App& app) {
    // Every input is checked before the editor is built.
    const int page = pageIndex(page_);
    const bool haveLevel = !level_.empty();
    const float level = haveLevel ? parseLevel(level_) : 0.0f;
    EventScript script;
    std::string problem;
    if (!events_.empty() && !script.load(events_, &problem)) throw CliError(problem);
    std::error_code ec;
    if (!profile_.empty() && !fs::is_regular_file(profile_, ec))
        throw CliError("the appearance file " + inQuotes(profile_) + " does not exist");
    setup_.collect(app);

    std::unique_ptr<ReverbCore> core = haveLevel ? std::make_unique<LevelCore>(level) : std::make_unique<ReverbCore>();
    setup_.apply(*core);

    HeadlessHost host(profile_, profile_.empty() ? std::string() : folderOf(profile_), presetFolderOrNone());
    PageSet pages(*core, &host);
    if (pages.failed()) throw CliError("the editor's pages could not be built", kExitFailure);
    EditorWindow& window = pages.window();
    host.show(&window);
    host.settle();
    window.showPage(page);
    script.play(window, host);
    if (haveLevel && window.currentPage() != kAboutPage) {
        // One tick lets the needle read the level (on the about page it would advance the credits instead).
        window.tick();
        host.settle();
    }

    // The settings file waits beside its name until the picture is written.
    std::unique_ptr<TempOutput> state;
    if (!saveState_.empty()) {
        uint8_t record[kCoreStateSize];
        if (!core->saveState(record)) throw CliError("the settings could not be saved", kExitFailure);
        state = std::make_unique<TempOutput>(saveState_);
        writeAll(state->release(), record, sizeof record, saveState_);
    }
    PngPresenter png(output_);
    if (!png.present(*window.surface(), 0, 0, kEditorWidth, kEditorHeight)) throw CliError(png.error(), kExitFailure);
    if (state) {
        try {
            state->commit();
        } catch (const CliError&) {
            fs::remove(output_, ec);
            throw;
        }
    }
}

}  // namespace ulvetta
