#pragma once

// What a test's code prints, and whether it makes sure that it is out.

#include <gtest/gtest.h>

#include <iostream>
#include <sstream>
#include <streambuf>
#include <string>

namespace ZULMetaData::Test {

template <class Action>
std::string printedBy(const Action& action) {
    testing::internal::CaptureStdout();
    action();
    return testing::internal::GetCapturedStdout();
}

/// Takes the place of the standard output as long as it lives.
class FlushCounter : public std::stringbuf {
public:
    FlushCounter() : original_(std::cout.rdbuf(this)) {}
    ~FlushCounter() override { std::cout.rdbuf(original_); }

    int flushes() const { return flushes_; }

protected:
    int sync() override {
        ++flushes_;
        return 0;
    }

private:
    std::streambuf* original_;
    int flushes_ = 0;
};

} // namespace ZULMetaData::Test
