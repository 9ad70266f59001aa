// What WebAssembly needs beside the C interface: bytes come from a function of the page.

#include "Bindings/JavaScript/zulmetadata_c.h"

#include <cstddef>
#include <cstdint>

// zulmetadata.js reads these in place.
static_assert(sizeof(void*) == 4 && sizeof(ZulmStream) == 64 && sizeof(ZulmColumn) == 24);
static_assert(offsetof(ZulmStream, kind) == 0 && offsetof(ZulmStream, uuid) == 4 &&
              offsetof(ZulmStream, version) == 8 && offsetof(ZulmStream, entries) == 16 &&
              offsetof(ZulmStream, bytes) == 24 && offsetof(ZulmStream, offset) == 32 &&
              offsetof(ZulmStream, first) == 40 && offsetof(ZulmStream, last) == 48 &&
              offsetof(ZulmStream, isKnown) == 56);
static_assert(offsetof(ZulmColumn, name) == 0 && offsetof(ZulmColumn, type) == 4 && offsetof(ZulmColumn, values) == 8 &&
              offsetof(ZulmColumn, pool) == 12 && offsetof(ZulmColumn, ends) == 16 &&
              offsetof(ZulmColumn, distinct) == 20);

extern "C" {

/// Returns the number of bytes that it put at `bytes`, or -1 if reading failed. Positions fit into the 53 bits of a
/// number.
__attribute__((import_module("zulm"), import_name("readAt"))) std::int32_t
zulm_host_read_at(double position, void* bytes, std::size_t size);

__attribute__((export_name("zulm_open_host"))) ZulmRecording* zulm_open_host(double size, const char* name) {
    const auto readAt = [](void*, std::uint64_t position, void* bytes, std::size_t wanted) -> std::int64_t {
        return zulm_host_read_at(static_cast<double>(position), bytes, wanted);
    };
    return zulm_open(readAt, nullptr, static_cast<std::uint64_t>(size), name);
}

} // extern "C"
