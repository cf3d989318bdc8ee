#include "platform/effects/effect_parameter.h"

#include <algorithm>
#include <cmath>

namespace Fx {

namespace {

constexpr std::string_view kKindNames[] = {"number", "switch", "choice", "colour", "point", "text", "file"};
constexpr std::string_view kInterpolationNames[] = {"hold", "linear", "smooth"};

/// Reads so many numbers, with blanks or commas between them. False for any other text.
bool readNumbers(std::string_view text, std::span<double> numbers, size_t least) {
    String blanks(text);
    std::replace(blanks.begin(), blanks.end(), ',', ' ');
    const std::vector<String> parts = blanks.split(' ', true);
    if (parts.size() < least || parts.size() > numbers.size()) {
        return false;
    }
    for (size_t i = 0; i < parts.size(); ++i) {
        if (!Qx::textToDouble(parts[i], numbers[i])) {
            return false;
        }
    }
    return true;
}

int hexDigit(char c) {
    const int at = static_cast<int>(std::string_view("0123456789abcdef")
                                        .find(c >= 'A' && c <= 'F' ? static_cast<char>(c - 'A' + 'a') : c));
    return at;
}

/// "#rrggbb" or "#rrggbbaa".
bool readHexColour(std::string_view text, std::array<double, 4>& numbers) {
    if ((text.size() != 7 && text.size() != 9) || text[0] != '#') {
        return false;
    }
    for (size_t i = 1; i + 1 < text.size(); i += 2) {
        const int high = hexDigit(text[i]);
        const int low = hexDigit(text[i + 1]);
        if (high < 0 || low < 0) {
            return false;
        }
        numbers[i / 2] = (high * 16 + low) / 255.0;
    }
    return true;
}

bool readSwitch(std::string_view text, double& value) {
    const bool isOn = String::equalNoCase(text, "on") || String::equalNoCase(text, "true") || text == "1";
    const bool isOff = String::equalNoCase(text, "off") || String::equalNoCase(text, "false") || text == "0";
    value = isOn ? 1 : 0;
    return isOn || isOff;
}

bool readChoice(std::string_view text, const ParameterForm* form, double& value) {
    for (size_t i = 0; form != nullptr && i < form->choices.size(); ++i) {
        if (String::equalNoCase(text, form->choices[i])) {
            value = form->least + static_cast<double>(i);
            return true;
        }
    }
    long long number = 0;
    if (!Qx::textToInt(text, number) || number < 0 || number > UINT32_MAX) {
        return false;
    }
    value = static_cast<double>(number);
    return true;
}

} // namespace

std::string_view parameterKindName(ParameterKind kind) {
    const size_t at = static_cast<size_t>(kind) - 1;
    return at < std::size(kKindNames) ? kKindNames[at] : std::string_view();
}

std::string_view interpolationName(Interpolation interpolation) {
    const auto at = static_cast<size_t>(interpolation);
    return at < std::size(kInterpolationNames) ? kInterpolationNames[at] : std::string_view();
}

bool readInterpolation(std::string_view text, Interpolation& interpolation) {
    for (size_t i = 0; i < std::size(kInterpolationNames); ++i) {
        if (String::equalNoCase(text, kInterpolationNames[i])) {
            interpolation = static_cast<Interpolation>(i);
            return true;
        }
    }
    return false;
}

String valueToText(const Sample& sample, const ParameterForm* form) {
    const std::array<double, 4>& its = sample.numbers;
    switch (sample.kind) {
    case ParameterKind::Switch:
        return sample.isOn() ? "on" : "off";
    case ParameterKind::Choice: {
        const double at = form != nullptr ? sample.number() - form->least : -1;
        const bool isNamed = at >= 0 && at < static_cast<double>(form->choices.size());
        return isNamed ? String(form->choices[static_cast<size_t>(at)])
                       : String(std::to_string(sample.choice()));
    }
    case ParameterKind::Colour: {
        const String text =
            Qx::doubleToText(its[0]) + " " + Qx::doubleToText(its[1]) + " " + Qx::doubleToText(its[2]);
        return its[3] == 1 ? text : String(text + " " + Qx::doubleToText(its[3]));
    }
    case ParameterKind::Point:
        return Qx::doubleToText(its[0]) + " " + Qx::doubleToText(its[1]);
    case ParameterKind::Text:
    case ParameterKind::File:
        return String(sample.text);
    case ParameterKind::Number:
        break;
    }
    return Qx::doubleToText(its[0]);
}

bool textToValue(std::string_view text, ParameterKind kind, const ParameterForm* form,
                 ParameterValue& value) {
    Sample its;
    its.kind = kind;
    bool isRead = true;
    switch (kind) {
    case ParameterKind::Number:
        isRead = Qx::textToDouble(text, its.numbers[0]);
        break;
    case ParameterKind::Switch:
        isRead = readSwitch(text, its.numbers[0]);
        break;
    case ParameterKind::Choice:
        isRead = readChoice(text, form, its.numbers[0]);
        break;
    case ParameterKind::Colour:
        its.numbers[3] = 1;
        isRead = readHexColour(text, its.numbers) || readNumbers(text, its.numbers, 3);
        break;
    case ParameterKind::Point:
        isRead = readNumbers(text, std::span(its.numbers).first(2), 2);
        break;
    case ParameterKind::Text:
    case ParameterKind::File:
        its.text = text;
        break;
    }
    const ParameterValue read = isRead ? ParameterValue(its) : ParameterValue();
    if (!isRead || !(form != nullptr ? form->accepts(read) : read.isUsable())) {
        return false;
    }
    value = read;
    return true;
}

} // namespace Fx
