#pragma once

#include "../../../SharedDependencies/Export.h"
#include "../../../ZULMetaData/ZULMMetaDataReader.h"

#include <vector>

namespace ZULMetaData {

/// Collects all entries of a stream, in its order.
template <StreamValue T>
class ZULMETADATA_API MetaDataObserver : public DataStreamObserver<T> {
public:
    std::vector<T> values;     ///< the values, in the order of the stream
    std::vector<double> times; ///< the time of each value, in seconds

    bool dataRead(double time, const T& value) override {
        values.push_back(value);
        times.push_back(time);
        return true;
    }
};

} // namespace ZULMetaData
