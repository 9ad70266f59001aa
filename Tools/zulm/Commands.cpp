#include "Tools/zulm/Commands.h"

namespace Zulm {

std::vector<CommandGroup> commandGroups() {
    return {{"Look", {addInfoCommand, addAtomsCommand, addDumpCommand, addDiffCommand, addGrepCommand, addViewCommand}},
            {"Check and rescue", {addVerifyCommand, addRepairCommand, addSalvageCommand}},
            {"Change", {addAttachCommand, addStampCommand, addRedactCommand}},
            {"Convert", {addExtractCommand, addConvertCommand}},
            {"Try", {addDemoCommand}}};
}

} // namespace Zulm
