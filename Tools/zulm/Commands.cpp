#include "Tools/zulm/Commands.h"

namespace Zulm {

std::vector<CommandGroup> commandGroups() {
    return {{"Look", {addInfoCommand, addAtomsCommand, addDumpCommand, addDiffCommand, addGrepCommand, addViewCommand}},
            {"Check and rescue", {addVerifyCommand, addRepairCommand, addSalvageCommand}},
            {"Change", {addAttachCommand, addStampCommand, addRedactCommand, addCompactCommand, addDetachCommand}},
            {"Convert", {addExtractCommand, addConvertCommand}},
            {"Try", {addDemoCommand}}};
}

} // namespace Zulm
