#include "platform/services/config_int.h"

#include "platform/base/qx_string.h"

#include <cstdlib>
#include <map>
#include <mutex>

namespace {

struct Settings {
    std::mutex mutex;
    std::map<String, int> values; ///< by name in upper case
};

Settings& settings() {
    static auto& shared = *new Settings;
    return shared;
}

/// The environment variable of a setting. What a variable's name cannot hold is written as '_'.
String variableFor(const String& upperName) {
    String variable = "QUILLMARCH_" + upperName;
    for (char& c : variable) {
        const bool plain = (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_';
        c = plain ? c : '_';
    }
    return variable;
}

} // namespace

int config_int(const char* name, int defaultValue) {
    if (name == nullptr || *name == '\0') {
        return defaultValue;
    }
    const String key = String(name).upper();
    {
        const std::lock_guard hold(settings().mutex);
        const auto found = settings().values.find(key);
        if (found != settings().values.end()) {
            return found->second;
        }
    }
    int value = defaultValue;
    if (const char* text = std::getenv(variableFor(key).c_str())) {
        if (!Qx::textToInt(String(text).trimmed(), value)) {
            return defaultValue;
        }
    }
    return value;
}

namespace Qx {

void setConfigInt(const char* name, int value) {
    if (name != nullptr && *name != '\0') {
        const std::lock_guard hold(settings().mutex);
        settings().values[String(name).upper()] = value;
    }
}

void clearConfigInt(const char* name) {
    if (name != nullptr) {
        const std::lock_guard hold(settings().mutex);
        settings().values.erase(String(name).upper());
    }
}

} // namespace Qx
