#include "tools/qmedit/value_text.h"

String valueText(const configb::Value& value, const Console& console) {
    return std::visit(
        [&](const auto& content) -> String {
            using Type = std::decay_t<decltype(content)>;
            if constexpr (std::is_same_v<Type, String>) {
                return console.safe(content);
            } else if constexpr (std::is_same_v<Type, cookie>) {
                return content.asString();
            } else if constexpr (std::is_same_v<Type, double>) {
                return Qx::doubleToText(content);
            } else if constexpr (std::is_same_v<Type, bool>) {
                return content ? "true" : "false";
            } else {
                return String(std::to_string(content));
            }
        },
        value);
}
