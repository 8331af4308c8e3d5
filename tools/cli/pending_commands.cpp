// Subcommands whose library functions have not landed in this build yet.
#include <ostream>

#include "commands.h"
#include "failure.h"
#include "layouts.h"

namespace tessarine::cli {

void RunConvert(const ConvertOptions &options, std::ostream &) {
    LayoutNamed(options.layout);
    throw Failure(options.input, "convert is not available in this build");
}
void RunLevels(const LevelsOptions &options, std::ostream &, std::ostream &) {
    throw Failure(options.file, "levels is not available in this build");
}

}  // namespace tessarine::cli
