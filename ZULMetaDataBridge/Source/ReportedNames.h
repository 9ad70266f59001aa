#pragma once

// The words for containers and for states of movies in reports and in other languages.

#include "../../ZULMetaData/Containers/ContainerType.h"
#include "../../ZULMetaData/Containers/RepairPlan.h"

namespace ZULMetaData {

/// Returns "movie", "RIFF" or "stream".
constexpr const char* containerName(Container::Type type) {
    switch (type) {
    case Container::QuickTime: return "movie";
    case Container::Riff: return "RIFF";
    default: return "stream";
    }
}

/// Returns "whole", "repairable" or "unrepairable".
constexpr const char* repairStateName(RepairPlan::State state) {
    switch (state) {
    case RepairPlan::Whole: return "whole";
    case RepairPlan::Repairable: return "repairable";
    default: return "unrepairable";
    }
}

} // namespace ZULMetaData
