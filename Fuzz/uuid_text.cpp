// An identifier as text: what was read is written and read again.

#include "Fuzz/Target.h"
#include "ZULMetaData/ZULMMetaDataUUIDs.h"

#include <sstream>

using namespace ZULMetaData;

void runTarget(std::string_view bytes) {
    std::istringstream stream{std::string(bytes)};
    uuid read{};
    stream >> read;
    std::ostringstream text;
    text << read;
    std::istringstream again(text.str());
    uuid readAgain{};
    again >> readAgain;
    if (readAgain != read)
        Fuzz::fail("another identifier");
}
