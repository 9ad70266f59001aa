#pragma once

#include "Tools/render/Options.h"
#include "Tools/zulm/Command.h"

namespace Render {

/// Makes a film, a GIF or single frames. Throws `Zulm::Failure`, `ZULMetaData::Error` and `Zulm::Interruption`; nothing
/// is written then.
Zulm::ExitCode render(const RenderOptions& options);

} // namespace Render
