#include "apply_filter/FilterValues.h"

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/filter_graph/FilterGraph.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <sstream>
#include <type_traits>
#include <vector>

namespace example {

namespace {

namespace FG = ORVO::FilterGraph;

// How many numbers a type has, and of which kind. All vectors and matrices are plain rows of their
// components.
template <typename T>
struct Components {
    using Number = float;
};
template <>
struct Components<int> {
    using Number = int;
};
template <>
struct Components<ORVO::int2> : Components<int> {};
template <>
struct Components<ORVO::int3> : Components<int> {};
template <>
struct Components<ORVO::int4> : Components<int> {};
template <>
struct Components<bool> {
    using Number = bool;
};
template <>
struct Components<ORVO::bool2> : Components<bool> {};
template <>
struct Components<ORVO::bool3> : Components<bool> {};
template <>
struct Components<ORVO::bool4> : Components<bool> {};

template <typename T>
using NumberOf = typename Components<T>::Number;

std::vector<std::string> splitAtCommas(std::string const& text) {
    std::vector<std::string> items;
    std::istringstream stream(text);
    for (std::string item; std::getline(stream, item, ',');)
        items.push_back(item);
    return items;
}

bool parseNumber(std::string const& text, bool& value) {
    value = text == "true" || text == "1";
    return value || text == "false" || text == "0";
}

template <typename Number>
bool parseNumber(std::string const& text, Number& value) {
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc() && end == text.data() + text.size();
}

template <typename Number>
bool parseNumbers(std::string const& text, std::vector<Number>& numbers) {
    for (auto const& item : splitAtCommas(text)) {
        Number number{};
        if (!parseNumber(item, number))
            return false;
        numbers.push_back(number);
    }
    return !numbers.empty();
}

template <typename T>
std::vector<NumberOf<T>> numbersOf(T const& value) {
    static_assert(std::is_trivially_copyable_v<T>);
    NumberOf<T> raw[sizeof(T) / sizeof(NumberOf<T>)];
    std::memcpy(raw, &value, sizeof(T));
    return std::vector<NumberOf<T>>(std::begin(raw), std::end(raw));
}

template <typename T>
bool parse(std::string const& text, T& value) {
    std::vector<NumberOf<T>> parsed;
    constexpr std::size_t count = sizeof(T) / sizeof(NumberOf<T>);
    auto const numbers = splitAtCommas(text);
    NumberOf<T> raw[count];
    for (std::size_t i = 0; i < count; ++i)
        if (numbers.size() != count || !parseNumber(numbers[i], raw[i]))
            return false;
    std::memcpy(&value, raw, sizeof(T));
    return true;
}

bool parse(std::string const& text, std::vector<float>& value) { return parseNumbers(text, value); }

bool parse(std::string const& text, std::string& value) {
    value = text;
    return true;
}

template <typename Number>
std::string joined(std::vector<Number> const& numbers) {
    std::ostringstream stream;
    stream << std::boolalpha;
    for (std::size_t i = 0; i < numbers.size(); ++i)
        stream << (i > 0 ? "," : "") << static_cast<Number>(numbers[i]);
    return stream.str();
}

std::string textOf(std::string const& value) { return value; }

std::string textOf(std::vector<float> const& value) { return joined(value); }

template <typename T>
std::string textOf(T const& value) {
    return joined(numbersOf(value));
}

// Calls operation(T{}) with T the parameter's type; false for the type that has no text, a pointer.
template <typename Operation>
bool withType(FG::DataItemBase::teType type, Operation operation) {
    switch (static_cast<int>(type)) {
    case 0:
        operation(bool{});
        return true;
    case 1:
        operation(ORVO::bool2(false));
        return true;
    case 2:
        operation(ORVO::bool3(false));
        return true;
    case 3:
        operation(ORVO::bool4(false));
        return true;
    case 4:
        operation(int{});
        return true;
    case 5:
        operation(ORVO::int2(0));
        return true;
    case 6:
        operation(ORVO::int3(0));
        return true;
    case 7:
        operation(ORVO::int4(0));
        return true;
    case 8:
        operation(float{});
        return true;
    case 9:
        operation(ORVO::float2(0));
        return true;
    case 10:
        operation(ORVO::float3(0));
        return true;
    case 11:
        operation(ORVO::float4(0));
        return true;
    case 12:
        operation(ORVO::float2x2());
        return true;
    case 13:
        operation(ORVO::float3x3());
        return true;
    case 14:
        operation(ORVO::float4x4());
        return true;
    case 15:
        operation(std::vector<float>());
        return true;
    case 16:
        operation(std::string());
        return true;
    default:
        return false;
    }
}

// Whether the parameter's number is the code of a colour space.
bool isProfileCode(FG::ParameterBase const& parameter) {
    std::string const suffix = "Profile";
    std::string const& name = parameter.name();
    return parameter.type() == FG::DataItemType<int>::value && name.size() > suffix.size() &&
           name.compare(name.size() - suffix.size(), suffix.size(), suffix) == 0;
}

// Up to four characters, filled up with spaces, or a number. Four characters are always a code: "2020" is
// one.
bool parseProfileCode(std::string const& text, int& code) {
    std::uint32_t number = 0;
    bool const hexadecimal = text.size() > 2 && text[0] == '0' && (text[1] == 'x' || text[1] == 'X');
    char const* const begin = text.data() + (hexadecimal ? 2 : 0);
    char const* const last = text.data() + text.size();
    auto const [end, error] = std::from_chars(begin, last, number, hexadecimal ? 16 : 10);
    bool const isNumber = error == std::errc() && end == last && (hexadecimal || text.size() != 4);
    if (!isNumber) {
        if (text.empty() || text.size() > 4)
            return false;
        char characters[5] = "    ";
        std::copy(text.begin(), text.end(), characters);
        number = ORVO::ColourEngine::profileCode(characters);
    }
    code = static_cast<int>(number);
    return true;
}

std::string profileCodeText(int code) {
    char text[16];
    std::snprintf(text, sizeof text, "0x%08x", static_cast<unsigned>(code));
    return text;
}

template <typename T>
bool isOutside(T const& value, FG::ParameterBase const& parameter) {
    if constexpr (!std::is_trivially_copyable_v<T>) {
        return false;
    } else {
        auto const numbers = numbersOf(value);
        auto const bound = [&](char const* name) {
            auto const* item = parameter.metadataItem(name);
            return item ? numbersOf(item->template as<T>().value()) : std::vector<NumberOf<T>>();
        };
        auto const minimum = bound("Minimum Value");
        auto const maximum = bound("Maximum Value");
        for (std::size_t i = 0; i < numbers.size(); ++i) {
            bool const inside = (minimum.empty() || numbers[i] >= minimum[i]) &&
                                (maximum.empty() || numbers[i] <= maximum[i]);
            if (!inside)
                return true;
        }
        return false;
    }
}

} // namespace

std::string typeName(FG::ParameterBase const& parameter) {
    static char const* const names[] = {"bool",     "bool2",    "bool3",    "bool4",   "int",    "int2",
                                        "int3",     "int4",     "float",    "float2",  "float3", "float4",
                                        "float2x2", "float3x3", "float4x4", "numbers", "text"};
    auto const type = static_cast<std::size_t>(parameter.type());
    return type < std::size(names) ? names[type] : "pointer";
}

std::string valueText(FG::ParameterBase const& parameter, std::string const& item) {
    if (item.empty() && isProfileCode(parameter))
        return profileCodeText(parameter.as<int>().value());
    std::string text;
    withType(parameter.type(), [&](auto const& sample) {
        using T = std::decay_t<decltype(sample)>;
        if (item.empty())
            text = textOf(parameter.as<T>().value());
        else if (auto const* metadata = parameter.metadataItem(item))
            text = textOf(metadata->template as<T>().value());
    });
    return text;
}

std::string setValue(FG::IFilter& filter, std::string const& name, std::string const& text) {
    FG::ParameterBase* const parameter = filter.parameter(name);
    if (!parameter)
        throw ValueError("The filter \"" + filter.identifier().name() + "\" has no parameter \"" + name +
                         "\"");
    if (int code = 0; isProfileCode(*parameter)) {
        if (!parseProfileCode(text, code))
            throw ValueError("The parameter \"" + name + "\" is a colour space, which \"" + text +
                             "\" is not: four characters or a number");
        parameter->as<int>().setValue(code);
        return {};
    }
    std::string warning;
    bool parsed = false;
    bool const known = withType(parameter->type(), [&](auto sample) {
        using T = decltype(sample);
        parsed = parse(text, sample);
        if (!parsed)
            return;
        parameter->as<T>().setValue(sample);
        if (isOutside(sample, *parameter))
            warning = name + "=" + text + " is outside " + valueText(*parameter, "Minimum Value") + " to " +
                      valueText(*parameter, "Maximum Value");
    });
    if (!known)
        throw ValueError("The parameter \"" + name + "\" is a pointer and cannot be set from text");
    if (!parsed)
        throw ValueError("The parameter \"" + name + "\" is of type " + typeName(*parameter) + ", which \"" +
                         text + "\" is not");
    return warning;
}

} // namespace example
