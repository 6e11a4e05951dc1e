// `ulvetta skin OUT.png`: a review sheet of the editor's artwork, drawn by the editor's own drawing layer.
#pragma once

#include <string>

namespace ulvetta {

// Draws every bitmap resource of the module (labelled with its id) and both fonts' whole character sets in
// several colours and alphas, and writes the sheet as a PNG. Throws CliError when the file cannot be written.
void writeSkinSheet(const std::string& path);

}  // namespace ulvetta
