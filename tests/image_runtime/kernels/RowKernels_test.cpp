#include "orvo/image_runtime/kernels/RowKernels.h"

#include "orvo/core/math/Half.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <sstream>
#include <vector>

namespace ORVO::ImageRuntime {
namespace {

constexpr float INF = std::numeric_limits<float>::infinity();
constexpr float NOT_A_NUMBER = std::numeric_limits<float>::quiet_NaN();

std::vector<InstructionSet> supportedSets() {
    std::vector<InstructionSet> sets;
    for (InstructionSet const eSet :
         {InstructionSet::PLAIN, InstructionSet::SSE2, InstructionSet::AVX2, InstructionSet::AVX512}) {
        if (isSupported(eSet)) {
            sets.push_back(eSet);
        }
    }
    return sets;
}

/// A row that begins a given number of elements past a 64-byte boundary, with marked bytes before and behind
/// it.
template <class Channel>
class GuardedRow {
public:
    GuardedRow(std::size_t n, std::size_t nOffset) : n_(n), aStorage_(n * sizeof(Channel) + 320, MARK) {
        auto const nAddress = reinterpret_cast<std::uintptr_t>(aStorage_.data());
        nBegin_ = (-nAddress & 63) + 64 + nOffset * sizeof(Channel);
    }

    Channel* begin() { return reinterpret_cast<Channel*>(aStorage_.data() + nBegin_); }
    Channel operator[](std::size_t i) { return begin()[i]; }
    std::vector<Channel> values() { return std::vector<Channel>(begin(), begin() + n_); }

    bool isUntouchedAround() const {
        auto const pBegin = aStorage_.begin();
        auto const isMark = [](unsigned char value) { return value == MARK; };
        auto const nRowBegin = static_cast<std::ptrdiff_t>(nBegin_);
        auto const nRowEnd = static_cast<std::ptrdiff_t>(nBegin_ + n_ * sizeof(Channel));
        return std::all_of(pBegin, pBegin + nRowBegin, isMark) &&
               std::all_of(pBegin + nRowEnd, aStorage_.end(), isMark);
    }

private:
    static constexpr unsigned char MARK = 0xa5;
    std::size_t n_;
    std::vector<unsigned char> aStorage_;
    std::size_t nBegin_ = 0;
};

/// Whether element i of a row belongs to a group of four, with the floats so many elements past a 16-byte
/// boundary.
bool isInGroup(std::size_t i, std::size_t n, std::size_t nFloatOffset) {
    std::size_t const nHead = std::min<std::size_t>((4 - nFloatOffset % 4) % 4, n);
    return i >= nHead && i < nHead + (n - nHead) / 4 * 4;
}

double nearestEven(double value) {
    double const lower = std::floor(value);
    double const rest = value - lower;
    if (rest != 0.5) {
        return rest < 0.5 ? lower : lower + 1;
    }
    return std::fmod(lower, 2.0) == 0.0 ? lower : lower + 1;
}

float expectedFromUInt8(unsigned code, bool bGroup) {
    return static_cast<float>(bGroup ? code * static_cast<double>(0.003921568859f) : code / 255.0);
}

float expectedFromUInt16(unsigned code) { return static_cast<float>(code / 32768.0); }

/// The product is rounded to a float before it is rounded to an integer.
unsigned expectedUInt8(float value, bool bGroup) {
    double const scaled = static_cast<double>(value * 255.0f);
    if (std::isnan(scaled)) {
        return 0;
    }
    if (bGroup) {
        return static_cast<unsigned>(nearestEven(std::clamp(scaled, 0.0, 255.0)));
    }
    auto const integer = static_cast<std::int64_t>(std::clamp(scaled, -2147483648.0, 2147483647.0));
    return static_cast<unsigned>(integer & 255);
}

unsigned expectedUInt16(float value, bool bGroup) {
    if (std::isnan(value)) {
        return 0;
    }
    double const scaled = std::clamp(static_cast<double>(value), 0.0, 1.0) * 32768.0;
    // The sum of the scalar form is a float.
    return static_cast<unsigned>(bGroup ? nearestEven(scaled)
                                        : std::floor(static_cast<float>(scaled) + 0.5f));
}

/// Numbers at which conversions to integers change their mind, and those that are no numbers in 0..1.
std::vector<float> awkwardFloats() {
    std::vector<float> values = {0.0f,         -0.0f,         1.0f,       -1.0f,  1.5f,    2.0f,
                                 0.5f,         -0.2f,         0.999f,     1e-30f, -1e-30f, 1e-42f,
                                 1e10f,        -1e10f,        3e38f,      -3e38f, INF,     -INF,
                                 NOT_A_NUMBER, -NOT_A_NUMBER, 8421505.0f, 256.0f, 257.25f, -3.75f};
    for (int white : {255, 32768}) {
        for (int i = 0; i < 600; ++i) {
            // Halves, to meet integers and ties alike.
            float const value = static_cast<float>(i) * 0.5f / static_cast<float>(white);
            values.insert(values.end(), {value, std::nextafter(value, INF), std::nextafter(value, -INF)});
            values.insert(values.end(), {1.0f - value, std::nextafter(1.0f - value, INF)});
        }
    }
    std::mt19937 generator(7);
    for (int i = 0; i < 20000; ++i) {
        std::uint32_t const bits = static_cast<std::uint32_t>(generator());
        float value;
        std::memcpy(&value, &bits, sizeof(value));
        values.push_back(value);
        values.push_back(std::uniform_real_distribution<float>(-0.25f, 1.25f)(generator));
    }
    return values;
}

template <class Channel>
bool sameBits(Channel const* pLeft, Channel const* pRight, std::size_t n) {
    return n == 0 || std::memcmp(static_cast<void const*>(pLeft), static_cast<void const*>(pRight),
                                 n * sizeof(Channel)) == 0;
}

class RowKernelsOf : public testing::TestWithParam<InstructionSet> {
protected:
    RowKernels const& kernels() const { return rowKernels(GetParam()); }
};

TEST_P(RowKernelsOf, ConvertAll256CodesInEveryStretch) {
    for (std::size_t nOffset = 0; nOffset < 4; ++nOffset) {
        for (unsigned code = 0; code < 256; ++code) {
            std::size_t const n = 11;
            std::vector<std::uint8_t> const input(n, static_cast<std::uint8_t>(code));
            GuardedRow<float> output(n, nOffset);
            kernels().floatFromUInt8(output.begin(), input.data(), n, StoreMode::CACHED);
            for (std::size_t i = 0; i < n; ++i) {
                ASSERT_EQ(expectedFromUInt8(code, isInGroup(i, n, nOffset)), output[i])
                    << code << " at " << i;
            }
        }
    }
}

TEST_P(RowKernelsOf, ConvertAll65536CodesExactly) {
    std::vector<std::uint16_t> input(65536);
    for (unsigned code = 0; code < 65536; ++code) {
        input[code] = static_cast<std::uint16_t>(code);
    }
    for (std::size_t nOffset = 0; nOffset < 4; ++nOffset) {
        GuardedRow<float> output(input.size(), nOffset);
        kernels().floatFromUInt16(output.begin(), input.data(), input.size(), StoreMode::CACHED);
        for (unsigned code = 0; code < 65536; ++code) {
            ASSERT_EQ(expectedFromUInt16(code), output[code]);
        }
        EXPECT_EQ(1.0f, output[32768]);
        EXPECT_EQ(0.0f, output[0]);
    }
}

TEST_P(RowKernelsOf, GiveAllCodesOfTheScaleBack) {
    std::vector<std::uint16_t> words(32769);
    for (unsigned code = 0; code <= 32768; ++code) {
        words[code] = static_cast<std::uint16_t>(code);
    }
    for (std::size_t nOffset = 0; nOffset < 4; ++nOffset) {
        GuardedRow<float> floats(words.size(), nOffset);
        GuardedRow<std::uint16_t> back(words.size(), nOffset);
        kernels().floatFromUInt16(floats.begin(), words.data(), words.size(), StoreMode::CACHED);
        kernels().uInt16FromFloat(back.begin(), floats.begin(), words.size(), StoreMode::CACHED);
        EXPECT_EQ(words, back.values());
    }
    // Bytes come back in the groups of an aligned row.
    std::vector<std::uint8_t> bytes(256);
    for (unsigned code = 0; code < 256; ++code) {
        bytes[code] = static_cast<std::uint8_t>(code);
    }
    GuardedRow<float> floats(256, 0);
    GuardedRow<std::uint8_t> back(256, 0);
    kernels().floatFromUInt8(floats.begin(), bytes.data(), 256, StoreMode::CACHED);
    kernels().uInt8FromFloat(back.begin(), floats.begin(), 256, StoreMode::CACHED);
    EXPECT_EQ(bytes, back.values());
}

TEST_P(RowKernelsOf, ConvertAwkwardFloatsInEveryStretch) {
    for (float const value : awkwardFloats()) {
        for (std::size_t nOffset : {0, 1}) {
            std::size_t const n = 6;
            GuardedRow<float> input(n, nOffset);
            std::fill_n(input.begin(), n, value);
            std::uint8_t aBytes[6];
            std::uint16_t aWords[6];
            kernels().uInt8FromFloat(aBytes, input.begin(), n, StoreMode::CACHED);
            kernels().uInt16FromFloat(aWords, input.begin(), n, StoreMode::CACHED);
            for (std::size_t i = 0; i < n; ++i) {
                bool const bGroup = isInGroup(i, n, nOffset);
                ASSERT_EQ(expectedUInt8(value, bGroup), aBytes[i])
                    << value << " at " << i << " + " << nOffset;
                ASSERT_EQ(expectedUInt16(value, bGroup), aWords[i])
                    << value << " at " << i << " + " << nOffset;
            }
        }
    }
}

TEST_P(RowKernelsOf, MeetTheStatedExamples) {
    // One element of head, four of a group.
    GuardedRow<float> input(5, 3);
    std::uint8_t aBytes[5];
    std::uint16_t aWords[5];
    std::fill_n(input.begin(), 5, 1.5f);
    kernels().uInt8FromFloat(aBytes, input.begin(), 5, StoreMode::CACHED);
    EXPECT_EQ(126, aBytes[0]);
    EXPECT_EQ(255, aBytes[1]);

    float const values[] = {1.0f, 0.5f, 2.0f, -1.0f, NOT_A_NUMBER};
    unsigned const expected[] = {32768, 16384, 32768, 0, 0};
    for (int i = 0; i < 5; ++i) {
        std::fill_n(input.begin(), 5, values[i]);
        kernels().uInt16FromFloat(aWords, input.begin(), 5, StoreMode::CACHED);
        EXPECT_EQ(expected[i], aWords[0]) << values[i];
        EXPECT_EQ(expected[i], aWords[1]) << values[i];
    }
}

/// Every length around the sizes of vectors and blocks, every place of both rows in a cache line, both store
/// modes: the bits of the plain kernels, and not a byte beside the row.
template <class Output, class Input>
void comparePlaces(void (*kernel)(Output*, Input const*, std::size_t, StoreMode),
                   void (*plain)(Output*, Input const*, std::size_t, StoreMode),
                   std::vector<Input> const& source) {
    std::size_t const nOutputPlaces = 64 / sizeof(Output);
    std::size_t const nInputPlaces = 64 / sizeof(Input);
    std::size_t nNext = 0;
    for (std::size_t n : {0, 1, 2, 3, 4, 5, 7, 8, 15, 16, 17, 19, 31, 32, 33, 47, 63, 64, 65, 100, 131}) {
        for (std::size_t nOutput = 0; nOutput < nOutputPlaces; ++nOutput) {
            for (std::size_t nInput = 0; nInput < nInputPlaces; nInput += sizeof(Input) == 4 ? 1 : 5) {
                GuardedRow<Input> input(n, nInput);
                for (std::size_t i = 0; i < n; ++i) {
                    input.begin()[i] = source[nNext++ % source.size()];
                }
                GuardedRow<Output> expected(n, nOutput);
                plain(expected.begin(), input.begin(), n, StoreMode::CACHED);
                for (StoreMode const eStoreMode : {StoreMode::CACHED, StoreMode::STREAM}) {
                    GuardedRow<Output> output(n, nOutput);
                    kernel(output.begin(), input.begin(), n, eStoreMode);
                    ASSERT_TRUE(sameBits(expected.begin(), output.begin(), n))
                        << n << " elements, output at " << nOutput << ", input at " << nInput;
                    ASSERT_TRUE(output.isUntouchedAround()) << n;
                }
            }
        }
    }
}

template <class Channel>
std::vector<Channel> codes() {
    std::vector<Channel> values(std::size_t(1) << (8 * sizeof(Channel)));
    for (std::size_t i = 0; i < values.size(); ++i) {
        values[i] = static_cast<Channel>(i * 31);
    }
    return values;
}

TEST_P(RowKernelsOf, EqualThePlainOnesAtEveryPlace) {
    RowKernels const& plain = rowKernels(InstructionSet::PLAIN);
    comparePlaces(kernels().floatFromUInt8, plain.floatFromUInt8, codes<std::uint8_t>());
    comparePlaces(kernels().floatFromUInt16, plain.floatFromUInt16, codes<std::uint16_t>());
    comparePlaces(kernels().uInt8FromFloat, plain.uInt8FromFloat, awkwardFloats());
    comparePlaces(kernels().uInt16FromFloat, plain.uInt16FromFloat, awkwardFloats());
    comparePlaces(kernels().copyFloat, plain.copyFloat, awkwardFloats());
}

/// Rows between the places of their channels, as memory of a caller may lie.
template <class Output, class Input>
void compareOddPlaces(void (*kernel)(Output*, Input const*, std::size_t, StoreMode),
                      void (*plain)(Output*, Input const*, std::size_t, StoreMode),
                      std::vector<Input> const& source) {
    constexpr std::size_t n = 131;
    for (std::size_t nOutput = 0; nOutput < sizeof(Output); ++nOutput) {
        for (std::size_t nInput = 0; nInput < sizeof(Input); ++nInput) {
            alignas(64) unsigned char aInput[(n + 1) * sizeof(Input)];
            std::memcpy(aInput + nInput, static_cast<void const*>(source.data()), n * sizeof(Input));
            auto const* const pInput = reinterpret_cast<Input const*>(aInput + nInput);
            alignas(64) unsigned char aExpected[(n + 1) * sizeof(Output)] = {};
            plain(reinterpret_cast<Output*>(aExpected + nOutput), pInput, n, StoreMode::CACHED);
            for (StoreMode const eStoreMode : {StoreMode::CACHED, StoreMode::STREAM}) {
                alignas(64) unsigned char aOutput[(n + 1) * sizeof(Output)] = {};
                kernel(reinterpret_cast<Output*>(aOutput + nOutput), pInput, n, eStoreMode);
                ASSERT_EQ(0, std::memcmp(aExpected, aOutput, sizeof(aOutput))) << nOutput << " " << nInput;
            }
        }
    }
}

TEST_P(RowKernelsOf, TakeRowsAtOddAddresses) {
    RowKernels const& plain = rowKernels(InstructionSet::PLAIN);
    compareOddPlaces(kernels().floatFromUInt8, plain.floatFromUInt8, codes<std::uint8_t>());
    compareOddPlaces(kernels().floatFromUInt16, plain.floatFromUInt16, codes<std::uint16_t>());
    compareOddPlaces(kernels().uInt8FromFloat, plain.uInt8FromFloat, awkwardFloats());
    compareOddPlaces(kernels().uInt16FromFloat, plain.uInt16FromFloat, awkwardFloats());
    compareOddPlaces(kernels().copyFloat, plain.copyFloat, awkwardFloats());
}

/// The same for the kernels of the accessors, which know no stretches and no store mode.
template <class Output, class Input>
void compareAccessorPlaces(void (*kernel)(Output*, Input const*, std::size_t),
                           void (*plain)(Output*, Input const*, std::size_t),
                           std::vector<Input> const& source) {
    std::size_t nNext = 0;
    for (std::size_t n = 0; n < 70; ++n) {
        for (std::size_t nPlace = 0; nPlace < 16; ++nPlace) {
            GuardedRow<Input> input(n, nPlace);
            for (std::size_t i = 0; i < n; ++i) {
                input.begin()[i] = source[nNext++ % source.size()];
            }
            GuardedRow<Output> expected(n, 15 - nPlace);
            GuardedRow<Output> output(n, 15 - nPlace);
            plain(expected.begin(), input.begin(), n);
            kernel(output.begin(), input.begin(), n);
            ASSERT_TRUE(sameBits(expected.begin(), output.begin(), n)) << n << " elements at " << nPlace;
            ASSERT_TRUE(output.isUntouchedAround()) << n;
        }
    }
    GuardedRow<Output> expected(source.size(), 0);
    GuardedRow<Output> output(source.size(), 0);
    plain(expected.begin(), source.data(), source.size());
    kernel(output.begin(), source.data(), source.size());
    for (std::size_t i = 0; i < source.size(); ++i) {
        ASSERT_TRUE(sameBits(expected.begin() + i, output.begin() + i, 1)) << "value " << i;
    }
}

TEST_P(RowKernelsOf, EqualThePlainOnesOfTheAccessors) {
    RowKernels const& plain = rowKernels(InstructionSet::PLAIN);
    compareAccessorPlaces(kernels().unitFromUInt8, plain.unitFromUInt8, codes<std::uint8_t>());
    compareAccessorPlaces(kernels().floatFromHalf, plain.floatFromHalf, codes<std::uint16_t>());
    compareAccessorPlaces(kernels().clampedToUnit, plain.clampedToUnit, awkwardFloats());
    compareAccessorPlaces(kernels().uInt8FromUnit, plain.uInt8FromUnit, awkwardFloats());
    compareAccessorPlaces(kernels().halfFromUnit, plain.halfFromUnit, awkwardFloats());
}

TEST_P(RowKernelsOf, DecodeAllHalves) {
    std::vector<std::uint16_t> const input = codes<std::uint16_t>();
    GuardedRow<float> output(input.size(), 0);
    kernels().floatFromHalf(output.begin(), input.data(), input.size());
    for (std::size_t i = 0; i < input.size(); ++i) {
        int const nExponent = input[i] >> 10 & 31;
        int const nMantissa = input[i] & 1023;
        double const sign = input[i] & 0x8000 ? -1.0 : 1.0;
        if (nExponent == 31 && nMantissa) {
            ASSERT_TRUE(std::isnan(output[i])) << input[i];
            continue;
        }
        double const magnitude = nExponent == 31  ? std::numeric_limits<double>::infinity()
                                 : nExponent == 0 ? std::ldexp(nMantissa, -24)
                                                  : std::ldexp(1024 + nMantissa, nExponent - 25);
        ASSERT_EQ(static_cast<float>(sign * magnitude), output[i]) << input[i];
        ASSERT_EQ(std::signbit(sign), std::signbit(output[i])) << input[i];
    }
}

TEST_P(RowKernelsOf, RoundToTheNearestHalfOfTheUnitInterval) {
    // Between each pair of neighbouring halves from 0 to 1: the ends, the middle (to the even one), and
    // beside it.
    for (unsigned code = 0; code < 0x3c00; ++code) {
        float const lower = half::fromBits(static_cast<std::uint16_t>(code));
        float const upper = half::fromBits(static_cast<std::uint16_t>(code + 1));
        float const middle = (lower + upper) / 2;
        float const input[] = {lower, std::nextafter(middle, lower), middle, std::nextafter(middle, upper),
                               upper};
        unsigned const nEven = code % 2 == 0 ? code : code + 1;
        unsigned const expected[] = {code, code, nEven, code + 1, code + 1};
        std::uint16_t output[5];
        kernels().halfFromUnit(output, input, 5);
        for (int i = 0; i < 5; ++i) {
            ASSERT_EQ(expected[i], output[i]) << code << " " << i;
        }
    }
}

TEST_P(RowKernelsOf, TruncateTheExactProductForBytes) {
    std::vector<float> const input = awkwardFloats();
    std::vector<std::uint8_t> output(input.size());
    kernels().uInt8FromUnit(output.data(), input.data(), input.size());
    for (std::size_t i = 0; i < input.size(); ++i) {
        double const clamped =
            std::isnan(input[i]) ? 0.0 : std::clamp(static_cast<double>(input[i]), 0.0, 1.0);
        ASSERT_EQ(static_cast<int>(clamped * 255.0), output[i]) << input[i];
    }
}

INSTANTIATE_TEST_SUITE_P(Sets, RowKernelsOf, testing::ValuesIn(supportedSets()),
                         [](testing::TestParamInfo<InstructionSet> const& parameters) {
                             std::ostringstream stream;
                             stream << parameters.param;
                             std::string sName = stream.str();
                             sName.erase(std::remove(sName.begin(), sName.end(), '-'), sName.end());
                             return sName;
                         });

TEST(RowKernels, StreamLargeOutputsOnly) {
    EXPECT_EQ(StoreMode::CACHED, storeModeForOutput(0));
    EXPECT_EQ(StoreMode::CACHED, storeModeForOutput(64 << 10));
    EXPECT_EQ(StoreMode::STREAM, storeModeForOutput(std::numeric_limits<std::uint32_t>::max()));
}

} // namespace
} // namespace ORVO::ImageRuntime
