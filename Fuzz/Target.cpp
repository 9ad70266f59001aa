#include "Fuzz/Target.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <new>
#include <sstream>
#include <stdexcept>
#include <utility>

/// Blocks that `malloc` is asked for are refused like those of `new`.
extern "C" const char* __asan_default_options();
const char* __asan_default_options() {
    return "allocator_may_return_null=1:max_allocation_size_mb=64";
}

namespace {

constexpr std::size_t s_largestBlock = 16 << 20;

bool s_isRunning = false; // the fuzzer has no limit for itself
bool s_hasRefused = false;

void* allocate(std::size_t size) {
    if (s_isRunning && size > s_largestBlock) {
        s_hasRefused = true;
        return nullptr;
    }
    return std::malloc(size == 0 ? 1 : size);
}

/// Removed at the end of the program.
class Folder {
public:
    Folder() {
        const std::filesystem::path memory = "/dev/shm";
        const auto parent = std::filesystem::exists(memory) ? memory : std::filesystem::temp_directory_path();
        path_ = (parent / "zulm-fuzz-XXXXXX").string();
        if (!mkdtemp(path_.data()))
            Fuzz::fail("no folder");
    }
    ~Folder() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    Folder(const Folder&) = delete;
    Folder& operator=(const Folder&) = delete;
    const std::string& path() const { return path_; }

private:
    std::string path_;
};

bool isDocumented(std::string_view message) {
    return message == "invalid meta data entry" || message == "Got an entry size of 0";
}

} // namespace

namespace Fuzz {

void documented(const std::function<void()>& act) {
    try {
        act();
    } catch (const std::bad_alloc&) {
        if (!std::exchange(s_hasRefused, false))
            fail("out of memory");
    } catch (const std::runtime_error& error) {
        if (!isDocumented(error.what()))
            fail(error.what());
    }
}

void fail(std::string_view what) {
    std::fprintf(stderr, "target failed: %.*s\n", static_cast<int>(what.size()), what.data());
    std::abort();
}

bool hasRefusedMemory() {
    return std::exchange(s_hasRefused, false);
}

const std::string& folder() {
    static const Folder made;
    return made.path();
}

std::string fileOf(const std::string& name, std::string_view bytes) {
    const std::string path = folder() + '/' + name;
    std::ofstream(path, std::ios::binary).write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    return path;
}

std::string contentsOf(const std::string& path) {
    std::ostringstream bytes;
    bytes << std::ifstream(path, std::ios::binary).rdbuf();
    return bytes.str();
}

std::uint8_t takeByte(std::string_view& bytes) {
    if (bytes.empty())
        return 0;
    const auto first = static_cast<std::uint8_t>(bytes.front());
    bytes.remove_prefix(1);
    return first;
}

} // namespace Fuzz

int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    s_isRunning = true;
    runTarget({reinterpret_cast<const char*>(data), size});
    s_isRunning = false;
    return 0;
}

void* operator new(std::size_t size) {
    void* block = allocate(size);
    if (!block)
        throw std::bad_alloc();
    return block;
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    return allocate(size);
}

void operator delete(void* block) noexcept {
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept {
    std::free(block);
}
