#pragma once

#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ZULMMetaDataReader.h"

#include <vector>

namespace ZULMetaData {

/// Collects every entry of a stream, in the order in which they come.
template <StreamValue T>
class ZULMETADATA_API MetaDataObserver : public DataStreamObserver<T> {
public:
    std::vector<T> values;     ///< in the order of the stream
    std::vector<double> times; ///< in seconds, one for each value

    bool dataRead(double time, const T& value) override {
        values.push_back(value);
        times.push_back(time);
        return true;
    }
};

} // namespace ZULMetaData
