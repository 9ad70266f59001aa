#include "Tools/zulm/CommandLine.h"
#include "Tools/zulm/StandardStreams.h"

using namespace Zulm;

namespace {

std::vector<CommandGroup> commandGroups() {
    return {{"Look", {addInfoCommand, addAtomsCommand, addDumpCommand, addDiffCommand, addGrepCommand}},
            {"Check and rescue", {addVerifyCommand, addRepairCommand, addSalvageCommand}},
            {"Change", {addAttachCommand, addStampCommand, addRedactCommand}},
            {"Convert", {addExtractCommand, addConvertCommand}},
            {"Try", {addDemoCommand}}};
}

} // namespace

int main(int argc, char** argv) {
    secureStandardStreams();
    const ExitCode code = runCommandLine(argc, argv, commandGroups());
    return flushStandardOutput() ? code : ExitFailed;
}
