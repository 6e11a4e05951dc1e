// `ulvetta snapshot`: renders one page of the editor headless, through the same page code the Windows
// property page runs, after an optional script of mouse, key and tick events, and writes it as a PNG.
#pragma once

#include <string>

#include "CliSetup.h"

namespace CLI {
class App;
}  // namespace CLI

namespace ulvetta {

class SnapshotCommand {
public:
    // Adds the options and OUT.png to the subcommand.
    void attach(CLI::App& app);
    // After parsing: checks every input, renders and writes OUT (and the settings file of --save-state).
    // Throws CliError; nothing is written unless everything succeeds.
    void run(const CLI::App& app);

private:
    CoreSetup setup_;
    std::string page_ = "reverb";
    std::string profile_, events_, level_, saveState_, output_;
};

}  // namespace ulvetta
