// large_movies repair|attach|read MOVIE [STREAM]: what an application does with a movie, by the operations of the
// format and not by the safe save. Prints whether the repair gave true, or how many cursor locations are read.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <iostream>
#include <string_view>

using namespace ZULMetaData;

int main(int, char** argv) {
    const std::string_view what = argv[1];
    if (what == "repair")
        std::cout << ZULMAtomRepair::finalizeAtomsInFile(argv[2]) << '\n';
    else if (what == "attach")
        ZULMAtomWriter().writeMetaDataFiles({argv[3]}, argv[2]);
    else
        std::cout << CursorLocationMetaDataParser(argv[2]).read()->size() << '\n';
}
