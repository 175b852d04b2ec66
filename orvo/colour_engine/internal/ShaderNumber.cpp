#include "orvo/colour_engine/internal/ShaderNumber.h"

#include <array>
#include <charconv>

namespace ORVO::ColourEngine::Internal {

std::string shaderNumber(double value) {
    // Whatever the host's locale is.
    std::array<char, 32> aText{};
    auto const result = std::to_chars(aText.data(), aText.data() + aText.size(), static_cast<float>(value));
    std::string sText(aText.data(), result.ptr);
    if (sText.find_first_of(".e") == std::string::npos) {
        sText += ".0";
    }
    return sText.front() == '-' ? "(" + sText + ")" : sText;
}

} // namespace ORVO::ColourEngine::Internal
