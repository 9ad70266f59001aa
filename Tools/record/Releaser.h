#pragma once

namespace Recorder {

/// Lets a smart pointer free an object of a library in C with the library's own function.
template <auto release>
struct Releaser {
    template <class T>
    void operator()(T* object) const {
        release(object);
    }
};

} // namespace Recorder
