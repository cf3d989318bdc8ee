#include "platform/base/ole_splat.h"

#include "platform/base/qx_string.h"

#include <atomic>
#include <cstdio>

namespace {

void writeToStandardError(const char* message) {
    std::fprintf(stderr, "quillmarch: programming error: %s\n", message);
}

std::atomic<Qx::SplatHandler> current{&writeToStandardError};

} // namespace

void ole_splat(const char* form, ...) {
    va_list arguments;
    va_start(arguments, form);
    const String message = String::vformat(form, arguments);
    va_end(arguments);
    current.load()(message.c_str());
}

namespace Qx {

SplatHandler setSplatHandler(SplatHandler handler) {
    return current.exchange(handler != nullptr ? handler : &writeToStandardError);
}

} // namespace Qx
