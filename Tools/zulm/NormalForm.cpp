#include "Tools/zulm/NormalForm.h"

#include <utf8proc.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <new>

namespace Zulm {

namespace {

bool isASCII(const std::string& text) {
    return std::all_of(text.begin(), text.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

std::string inForm(const std::string& text, utf8proc_option_t form) {
    if (isASCII(text))
        return text;
    utf8proc_uint8_t* mapped = nullptr;
    const auto options = static_cast<utf8proc_option_t>(UTF8PROC_STABLE | form);
    const utf8proc_ssize_t size = utf8proc_map(reinterpret_cast<const utf8proc_uint8_t*>(text.data()),
                                               static_cast<utf8proc_ssize_t>(text.size()), &mapped, options);
    const std::unique_ptr<utf8proc_uint8_t, void (*)(void*)> owner(mapped, std::free);
    if (size == UTF8PROC_ERROR_NOMEM)
        throw std::bad_alloc();
    return size < 0 ? text : std::string(reinterpret_cast<const char*>(mapped), static_cast<std::size_t>(size));
}

} // namespace

std::string composed(const std::string& text) {
    return inForm(text, UTF8PROC_COMPOSE);
}

std::string decomposed(const std::string& text) {
    return inForm(text, UTF8PROC_DECOMPOSE);
}

} // namespace Zulm
