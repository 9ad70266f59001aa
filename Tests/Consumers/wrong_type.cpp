// Asks an entry for a type that it cannot hold. It does not compile; the test reads what the compiler says.

#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

double timeOf(const ZULMetaData::EntryDictionary& entry) {
    return entry.get<double>("timestamp");
}
