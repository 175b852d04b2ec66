#include "orvo/colour_engine/internal/Applier.h"

#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/core/utility/InstructionSet.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <thread>

namespace {

using namespace ORVO;
using namespace ORVO::ColourEngine::Internal;

using Colour = std::array<double, 3>;
using TransformPointer = std::shared_ptr<ResolvedTransform const>;

struct Packing {
    char const* name;
    bool gray;
    int bytes; ///< a channel
    int pixel; ///< bytes
};

constexpr Packing kPackings[] = {
    {"RGB8", false, 1, 3}, {"RGBA8", false, 1, 4}, {"RGB16", false, 2, 6}, {"RGBA16", false, 2, 8},
    {"GRAY8", true, 1, 1}, {"GRAYA8", true, 1, 2}, {"GRAY16", true, 2, 2}, {"GRAYA16", true, 2, 4},
};

constexpr Packing kRGB8 = kPackings[0];
constexpr Packing kRGB16 = kPackings[2];

/// Pixels in memory with the bytes between them.
struct PackedImage {
    Packing packing;
    int width;
    int height;
    int pitch;
    std::vector<unsigned char> bytes;

    PackedImage(Packing const& how, int w, int h, int padding = 0)
        : packing(how),
          width(w),
          height(h),
          pitch(w * how.pixel + padding),
          bytes(static_cast<std::size_t>(pitch) * static_cast<std::size_t>(h), 0xA5) {}

    int channels() const { return packing.gray ? 1 : 3; }
    double white() const { return packing.bytes == 1 ? 255.0 : 32768.0; }

    unsigned char* sample(int x, int y, int channel) {
        return bytes.data() + y * pitch + x * packing.pixel + channel * packing.bytes;
    }
    int get(int x, int y, int channel) {
        std::uint16_t value = 0;
        std::memcpy(&value, sample(x, y, channel), static_cast<std::size_t>(packing.bytes));
        return value;
    }
    void set(int x, int y, int channel, int value) {
        auto const word = static_cast<std::uint16_t>(value);
        std::memcpy(sample(x, y, channel), &word, static_cast<std::size_t>(packing.bytes));
    }

    void randomize(unsigned seed) {
        std::mt19937 random(seed);
        for (int y = 0; y < height; ++y) {
            for (int x = 0; x < width; ++x) {
                for (int c = 0; c < channels(); ++c) {
                    set(x, y, c, static_cast<int>(random() % static_cast<unsigned>(white() + 1)));
                }
            }
        }
    }

    Colour colour(int x, int y) {
        Colour result{};
        for (int c = 0; c < 3; ++c) {
            result[static_cast<std::size_t>(c)] = std::min(get(x, y, packing.gray ? 0 : c) / white(), 1.0);
        }
        return result;
    }

    _t_Vantle_PackingSpec spec() {
        _t_Vantle_PackingSpec record{};
        record.space = packing.gray ? _t_Vantle_PackingSpec::SPACE_GRAY : _t_Vantle_PackingSpec::SPACE_RGB;
        record.channels = static_cast<std::uint32_t>(channels());
        record.bytesPerChannel = static_cast<std::uint32_t>(packing.bytes);
        for (int c = 0; c < channels(); ++c) {
            record.planes[c] = {sample(0, 0, c), pitch, packing.pixel, 0, 0};
        }
        return record;
    }

    /// All bytes that no channel of the record owns are as the constructor left them.
    bool restIsUntouched() {
        for (int y = 0; y < height; ++y) {
            for (int i = 0; i < pitch; ++i) {
                bool const owned =
                    i < width * packing.pixel && i % packing.pixel < channels() * packing.bytes;
                if (!owned && bytes[static_cast<std::size_t>(y * pitch + i)] != 0xA5) {
                    return false;
                }
            }
        }
        return true;
    }
};

bool apply(Applier const& applier, PackedImage& from, PackedImage& to) {
    return applier.apply(from.spec(), to.spec(), static_cast<std::uint32_t>(from.height),
                         static_cast<std::uint32_t>(from.width));
}

ChannelCurve powerCurve(double exponent) {
    return ChannelCurve([exponent](double x) { return std::pow(std::max(x, 0.0), exponent); });
}

/// Of sRGB, which has a finite slope at black.
ChannelCurve encodedSRGB() {
    return ChannelCurve(
        [](double x) { return x <= 0.0031308 ? 12.92 * x : 1.055 * std::pow(x, 1.0 / 2.4) - 0.055; });
}

/// Three different curves on both sides. The blue row takes light away, so that it clips at both ends.
TransformPointer someShaper() {
    return std::make_shared<ResolvedTransform const>(
        MatrixShaper{{powerCurve(2.2), powerCurve(1.8), powerCurve(1.0)},
                     {0.7, 0.2, 0.1, /**/ 0.1, 0.8, 0.1, /**/ -0.4, -0.1, 1.9},
                     {powerCurve(1.0 / 2.2), powerCurve(1.0 / 3.0), encodedSRGB()}});
}

/// Exact under every interpolation, as it is linear: (1 - red, green / 2 + blue / 2, 0.25 + green / 2).
TransformPointer linearCube() {
    ColourCube cube;
    for (int b = 0; b < 33; ++b) {
        for (int g = 0; g < 33; ++g) {
            for (int r = 0; r < 33; ++r) {
                cube.aValues_.push_back(1.0F - static_cast<float>(r) / 32.0F);
                cube.aValues_.push_back(static_cast<float>(g + b) / 64.0F);
                cube.aValues_.push_back(0.25F + static_cast<float>(g) / 64.0F);
            }
        }
    }
    return std::make_shared<ResolvedTransform const>(cube);
}

TransformPointer randomCube() {
    std::mt19937 random(7);
    ColourCube cube;
    for (int i = 0; i < 3 * 33 * 33 * 33; ++i) {
        cube.aValues_.push_back(static_cast<float>(random() % 10001U) / 10000.0F);
    }
    return std::make_shared<ResolvedTransform const>(cube);
}

/// Steps of every kind, each of the tables with edges of its own: into Lab and back through one table, and
/// through one of words.
TransformPointer someStages() {
    auto const table = [](std::array<std::size_t, 3> const& edges, bool trilinear, bool words) {
        GridStage stage{edges, trilinear, words, {}};
        for (std::size_t k = 0; k < edges[2]; ++k) {
            for (std::size_t j = 0; j < edges[1]; ++j) {
                for (std::size_t i = 0; i < edges[0]; ++i) {
                    auto const x = static_cast<double>(i) / static_cast<double>(edges[0] - 1);
                    auto const y = static_cast<double>(j) / static_cast<double>(edges[1] - 1);
                    auto const z = static_cast<double>(k) / static_cast<double>(edges[2] - 1);
                    for (double const value : {x * x * 0.5 + 0.5 * x, y, 0.25 + 0.5 * z + 0.25 * x * y}) {
                        stage.aNodes_.push_back(
                            static_cast<float>(words ? std::round(value * 65535.0) / 65535.0 : value));
                    }
                }
            }
        }
        return stage;
    };
    ChannelCurve const gentle([](double x) { return 0.3 * x + 0.7 * x * x; });
    return std::make_shared<ResolvedTransform const>(TableStages{
        CurveStage{{powerCurve(1.4), powerCurve(0.9), powerCurve(1.0)}},
        MatrixStage{{0.6, 0.3, 0.06, /**/ 0.1, 0.8, 0.1, /**/ 0.05, 0.15, 0.6}, {0.01, 0.0, 0.02}},
        ConnectionStage::XYZ_TO_LAB, table({7, 4, 9}, true, false),
        CurveStage{{gentle, powerCurve(1.0), gentle}}, table({5, 6, 3}, false, false),
        table({9, 17, 5}, true, true), table({4, 9, 33}, false, true), ConnectionStage::LAB_TO_XYZ,
        MatrixStage{{1.1, -0.1, 0.0, /**/ -0.2, 1.2, 0.1, /**/ 0.3, 0.0, 0.7}, {-0.02, 0.0, 0.01}},
        CurveStage{{powerCurve(1.0 / 1.8), encodedSRGB(), powerCurve(1.0)}}});
}

/// Walks from the lower corner of the cell along the axes, that of the largest fraction first.
Colour tetrahedral(ColourCube const& cube, Colour const& colour) {
    std::array<int, 3> cell{};
    std::array<double, 3> fraction{};
    for (std::size_t i = 0; i < 3; ++i) {
        cell[i] = std::min(static_cast<int>(colour[i] * 32.0), 31);
        fraction[i] = colour[i] * 32.0 - cell[i];
    }
    std::array<std::size_t, 3> order = {0, 1, 2};
    std::sort(order.begin(), order.end(), [&](auto a, auto b) { return fraction[a] > fraction[b]; });
    auto const node = [&](std::size_t channel) {
        auto const index = static_cast<std::size_t>((cell[2] * 33 + cell[1]) * 33 + cell[0]);
        return static_cast<double>(cube.aValues_[3 * index + channel]);
    };
    Colour result = {node(0), node(1), node(2)};
    for (std::size_t axis : order) {
        Colour const before = {node(0), node(1), node(2)};
        ++cell[axis];
        for (std::size_t channel = 0; channel < 3; ++channel) {
            result[channel] += fraction[axis] * (node(channel) - before[channel]);
        }
    }
    return result;
}

/// The largest distance of the samples from exact values on their scale; at best it is 0.5.
template <typename Exact>
double worstDistance(PackedImage& from, PackedImage& to, Exact const& exact) {
    double worst = 0.0;
    for (int y = 0; y < to.height; ++y) {
        for (int x = 0; x < to.width; ++x) {
            Colour const expected = exact(from.colour(x, y));
            for (int c = 0; c < to.channels(); ++c) {
                double const value = expected[to.packing.gray ? 1 : static_cast<std::size_t>(c)];
                worst = std::max(worst, std::abs(value * to.white() - to.get(x, y, c)));
            }
        }
    }
    return worst;
}

std::vector<Core::InstructionSet> supportedSets() {
    std::vector<Core::InstructionSet> sets;
    for (auto set : {Core::InstructionSet::PLAIN, Core::InstructionSet::SSE2, Core::InstructionSet::AVX2,
                     Core::InstructionSet::AVX512}) {
        if (Core::isSupported(set)) {
            sets.push_back(set);
        }
    }
    return sets;
}

TEST(Applier, EveryPackingGoesIntoEveryOther) {
    for (auto const& transform : {someShaper(), linearCube()}) {
        Applier const applier(transform);
        for (Packing const& source : kPackings) {
            for (Packing const& destination : kPackings) {
                SCOPED_TRACE(testing::Message() << source.name << " to " << destination.name);
                // Wider than a block, and no multiple of any vector.
                PackedImage from(source, 135, 3, 5);
                PackedImage to(destination, 135, 3, 2);
                from.randomize(11);
                PackedImage const before = from;
                ASSERT_TRUE(apply(applier, from, to));
                EXPECT_EQ(before.bytes, from.bytes);
                EXPECT_TRUE(to.restIsUntouched());
                double const worst =
                    worstDistance(from, to, [&](Colour const& c) { return transform->evaluate(c); });
                EXPECT_LE(worst, destination.bytes == 1 ? 0.54 : 0.65);
            }
        }
    }
}

TEST(Applier, StepsOfEveryKindAgreeWithThePlainOnes) {
    auto const transform = someStages();
    Applier const applier(transform);
    for (Packing const& source : kPackings) {
        for (Packing const& destination : kPackings) {
            SCOPED_TRACE(testing::Message() << source.name << " to " << destination.name);
            PackedImage from(source, 135, 4, 5);
            PackedImage to(destination, 135, 4, 2);
            from.randomize(18);
            ASSERT_TRUE(apply(applier, from, to));
            EXPECT_TRUE(to.restIsUntouched());
            double const worst =
                worstDistance(from, to, [&](Colour const& c) { return transform->evaluate(c); });
            // One of the 65535 steps of a table that rounds to the other side is two of 32768 behind a slope
            // of 4.
            EXPECT_LE(worst, destination.bytes == 1 ? 0.56 : 4.0);
        }
    }
}

TEST(Applier, ValuesThatAreNoColoursEndAtTheEdges) {
    double const infinite = std::numeric_limits<double>::infinity();
    GridStage const table{
        {2, 2, 2}, false, false, {0, 0, 0, 1, 0, 0, 0, 1, 0, 1, 1, 0, 0, 0, 1, 1, 0, 1, 0, 1, 1, 1, 1, 1}};
    for (bool const words : {false, true}) {
        for (bool const trilinear : {false, true}) {
            GridStage grid = table;
            grid.bWords_ = words;
            grid.bTrilinear_ = trilinear;
            Applier const applier(std::make_shared<ResolvedTransform const>(TableStages{
                MatrixStage{{infinite, 0, 0, 0, -infinite, 0, 0, 0, 1e30}, {0.0, 0.0, -5e29}}, grid}));
            PackedImage from(kRGB16, 2, 1);
            PackedImage to(kRGB16, 2, 1);
            for (int c = 0; c < 3; ++c) {
                from.set(0, 0, c, 32768);
                from.set(1, 0, c, 0);
            }
            ASSERT_TRUE(apply(applier, from, to));
            EXPECT_EQ(32768, to.get(0, 0, 0));
            EXPECT_EQ(0, to.get(0, 0, 1));
            EXPECT_EQ(32768, to.get(0, 0, 2));
            // Infinity times 0 is no number; the third one is far below 0.
            EXPECT_LE(to.get(1, 0, 0), 32768);
            EXPECT_EQ(0, to.get(1, 0, 2));
        }
    }
}

TEST(Applier, CubesAreInterpolatedInTetrahedra) {
    auto const transform = randomCube();
    Applier const applier(transform);
    for (Packing const& packing : {kRGB8, kRGB16}) {
        PackedImage from(packing, 400, 6);
        PackedImage to(kRGB16, 400, 6);
        from.randomize(12);
        // Nodes, edges and the diagonal, where fractions are equal.
        int const step = packing.bytes == 1 ? 51 : 1024;
        for (int x = 0; x < 100; ++x) {
            for (int c = 0; c < 3; ++c) {
                from.set(x, 0, c, x * (c + 1) % (packing.bytes == 1 ? 6 : 33) * step);
                from.set(x, 1, c, x * (c > 0 ? 2 : 1) % 256);
            }
        }
        ASSERT_TRUE(apply(applier, from, to));
        double const worst = worstDistance(
            from, to, [&](Colour const& c) { return tetrahedral(*transform->colourCube(), c); });
        // Coordinates in single precision on slopes of up to 32 an edge: 32 * 32768 * 2^-20 in the worst
        // case.
        EXPECT_LE(worst, 1.5);
    }
}

TEST(Applier, BlackAndWhiteAreExactInEverySize) {
    // A matrix whose rows add up to 1 only nearly, as those of profiles do.
    Applier const applier(std::make_shared<ResolvedTransform const>(
        MatrixShaper{{powerCurve(2.2), powerCurve(2.2), powerCurve(2.2)},
                     {0.7151, 0.2849, 1e-9, /**/ 0.3, 0.6, 0.1, /**/ 0.0, 0.0412, 0.9587999999},
                     {powerCurve(1.0 / 2.2), powerCurve(1.0 / 2.2), encodedSRGB()}}));
    for (Packing const& source : kPackings) {
        for (Packing const& destination : kPackings) {
            PackedImage from(source, 2, 1);
            PackedImage to(destination, 2, 1);
            for (int c = 0; c < from.channels(); ++c) {
                from.set(0, 0, c, 0);
                from.set(1, 0, c, static_cast<int>(from.white()));
            }
            ASSERT_TRUE(apply(applier, from, to));
            for (int c = 0; c < to.channels(); ++c) {
                EXPECT_EQ(0, to.get(0, 0, c)) << source.name << " to " << destination.name;
                EXPECT_EQ(static_cast<int>(to.white()), to.get(1, 0, c)) << source.name;
            }
        }
    }
}

/// There and back through a curve, all values of 16 bits.
TEST(Applier, EveryWordComesBackThroughInverseCurves) {
    Applier const applier(std::make_shared<ResolvedTransform const>(
        MatrixShaper{{powerCurve(2.2), powerCurve(2.2), powerCurve(2.2)},
                     {1.0, 0.0, 0.0, /**/ 0.0, 1.0, 0.0, /**/ 0.0, 0.0, 1.0},
                     {powerCurve(1.0 / 2.2), powerCurve(1.0 / 2.2), powerCurve(1.0 / 2.2)}}));
    PackedImage from({"GRAY16", true, 2, 2}, 32769, 1);
    PackedImage to({"GRAY16", true, 2, 2}, 32769, 1);
    for (int x = 0; x < from.width; ++x) {
        from.set(x, 0, 0, x);
    }
    ASSERT_TRUE(apply(applier, from, to));
    int worst = 0;
    for (int x = 0; x < to.width; ++x) {
        worst = std::max(worst, std::abs(to.get(x, 0, 0) - x));
    }
    EXPECT_LE(worst, 1);
}

TEST(Applier, WordsAboveWhiteCountAsWhite) {
    for (auto const& transform : {someShaper(), linearCube()}) {
        Applier const applier(transform);
        PackedImage from(kRGB16, 2, 1);
        PackedImage to(kRGB16, 2, 1);
        for (int c = 0; c < 3; ++c) {
            from.set(0, 0, c, 32769 + 16383 * c);
            from.set(1, 0, c, 32768);
        }
        ASSERT_TRUE(apply(applier, from, to));
        for (int c = 0; c < 3; ++c) {
            EXPECT_EQ(to.get(1, 0, c), to.get(0, 0, c));
        }
    }
}

TEST(Applier, InstructionSetsAndPartsOfAPictureGiveTheSameBits) {
    auto const eActive = Core::activeInstructionSet();
    for (auto const& transform : {someShaper(), randomCube(), someStages()}) {
        Applier const applier(transform);
        for (Packing const& packing : {kRGB8, kRGB16}) {
            PackedImage from(packing, 333, 4);
            from.randomize(13);
            std::vector<unsigned char> first;
            for (auto set : supportedSets()) {
                Core::setActiveInstructionSet(set);
                PackedImage whole(packing, 333, 4);
                ASSERT_TRUE(apply(applier, from, whole));
                first = first.empty() ? whole.bytes : first;
                EXPECT_EQ(first, whole.bytes) << set;
            }
            Core::setActiveInstructionSet(eActive);
            PackedImage parts(packing, 333, 4);
            for (int y = 0; y < 4; ++y) {
                for (int x = 0; x < 333; x += 37) {
                    auto source = from.spec();
                    auto destination = parts.spec();
                    for (int c = 0; c < 3; ++c) {
                        source.planes[c].base = from.sample(x, y, c);
                        destination.planes[c].base = parts.sample(x, y, c);
                    }
                    ASSERT_TRUE(applier.apply(source, destination, 1, 37));
                }
            }
            EXPECT_EQ(first, parts.bytes);
        }
    }
}

TEST(Applier, PlanesMayLieAnywhere) {
    auto const transform = someShaper();
    Applier const applier(transform);
    PackedImage from(kRGB8, 130, 3);
    PackedImage to(kRGB16, 130, 3);
    from.randomize(14);
    ASSERT_TRUE(apply(applier, from, to));
    // The same colours in three separate planes, the rows from the bottom up; the result blue first.
    std::vector<unsigned char> planes[3];
    for (int c = 0; c < 3; ++c) {
        for (int y = 3; y-- > 0;) {
            for (int x = 0; x < 130; ++x) {
                planes[c].push_back(static_cast<unsigned char>(from.get(x, y, c)));
            }
        }
    }
    auto source = from.spec();
    PackedImage reversed(kRGB16, 130, 3);
    auto destination = reversed.spec();
    std::swap(destination.planes[0], destination.planes[2]);
    for (int c = 0; c < 3; ++c) {
        source.planes[c] = {planes[c].data() + 2 * 130, -130, 1, 0, 0};
    }
    ASSERT_TRUE(applier.apply(source, destination, 3, 130));
    for (int y = 0; y < 3; ++y) {
        for (int x = 0; x < 130; ++x) {
            for (int c = 0; c < 3; ++c) {
                ASSERT_EQ(to.get(x, y, c), reversed.get(x, y, 2 - c));
            }
        }
    }
}

TEST(Applier, WorksInPlace) {
    for (auto const& transform : {someShaper(), randomCube(), someStages()}) {
        Applier const applier(transform);
        for (Packing const& packing : kPackings) {
            PackedImage image(packing, 141, 2);
            image.randomize(15);
            PackedImage other(packing, 141, 2);
            ASSERT_TRUE(apply(applier, image, other));
            ASSERT_TRUE(apply(applier, image, image));
            EXPECT_EQ(other.bytes, image.bytes) << packing.name;
        }
    }
}

TEST(Applier, NoPixelsAreNoWork) {
    Applier const applier(someShaper());
    PackedImage from(kRGB8, 4, 4);
    PackedImage to(kRGB8, 4, 4);
    auto const before = to.bytes;
    EXPECT_TRUE(applier.apply(from.spec(), to.spec(), 0, 4));
    EXPECT_TRUE(applier.apply(from.spec(), to.spec(), 4, 0));
    EXPECT_EQ(before, to.bytes);
}

TEST(Applier, WrongRecordsAreRefused) {
    using Change = void (*)(_t_Vantle_PackingSpec&);
    Change const changes[] = {
        [](_t_Vantle_PackingSpec& record) { record.space = 0x434D594B; },
        [](_t_Vantle_PackingSpec& record) { record.space = _t_Vantle_PackingSpec::SPACE_GRAY; },
        [](_t_Vantle_PackingSpec& record) { record.channels = 1; },
        [](_t_Vantle_PackingSpec& record) { record.channels = 4; },
        [](_t_Vantle_PackingSpec& record) { record.bytesPerChannel = 0; },
        [](_t_Vantle_PackingSpec& record) { record.bytesPerChannel = 4; },
        [](_t_Vantle_PackingSpec& record) { record.planes[2].base = nullptr; },
    };
    Applier const applier(someShaper());
    PackedImage from(kRGB8, 4, 4);
    PackedImage to(kRGB8, 4, 4);
    from.randomize(16);
    auto const before = to.bytes;
    for (Change change : changes) {
        auto source = from.spec();
        change(source);
        EXPECT_FALSE(applier.apply(source, to.spec(), 4, 4));
        auto destination = to.spec();
        change(destination);
        EXPECT_FALSE(applier.apply(from.spec(), destination, 4, 4));
    }
    EXPECT_EQ(before, to.bytes);
    EXPECT_TRUE(apply(applier, from, to));
    EXPECT_NE(before, to.bytes);
}

TEST(Applier, ThreadsShareItFromTheFirstUseOn) {
    Applier const applier(someShaper());
    PackedImage from(kRGB16, 64, 16);
    from.randomize(17);
    std::vector<PackedImage> results(4, PackedImage(kRGB16, 64, 16));
    std::vector<std::thread> threads;
    for (auto& result : results) {
        threads.emplace_back([&] { EXPECT_TRUE(apply(applier, from, result)); });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    for (auto const& result : results) {
        EXPECT_EQ(results.front().bytes, result.bytes);
    }
    EXPECT_NE(PackedImage(kRGB16, 64, 16).bytes, results.front().bytes);
}

} // namespace
