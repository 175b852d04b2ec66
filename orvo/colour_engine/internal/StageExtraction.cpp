#include "orvo/colour_engine/internal/StageExtraction.h"

#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/ProfileTags.h"
#include "orvo/colour_engine/internal/TransformResolver.h"

#include <lcms2_plugin.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

using Vector = std::array<double, 3>;

/// XYZ in tables goes up to nearly 2.
constexpr double dEncodedXYZ = 1.0 + 32767.0 / 32768.0;
/// Lab in tables of 16 bits of the older kind has its white at 65280.
constexpr double dOlderLab = 65280.0 / 65535.0;

constexpr std::size_t nMaxNodes = std::size_t{1} << 20U;

Matrix diagonal(double x, double y, double z) { return {x, 0.0, 0.0, 0.0, y, 0.0, 0.0, 0.0, z}; }

/// A list of stages in which neighbours that are one, or nothing, become so.
class StageList {
public:
    void add(CurveStage stage) {
        auto const isStraight = [](ChannelCurve const& curve) {
            constexpr int nSteps = 4096;
            for (int i = 0; i <= nSteps; ++i) {
                double const x = static_cast<double>(i) / nSteps;
                // A curve of 16 bits rounds what it says.
                if (!(std::abs(curve(x) - x) <= 1e-5)) {
                    return false;
                }
            }
            return true;
        };
        if (!std::all_of(stage.aCurves_.begin(), stage.aCurves_.end(), isStraight)) {
            aStages_.emplace_back(std::move(stage));
        }
    }
    void add(MatrixStage const& stage) {
        auto* const pLast = aStages_.empty() ? nullptr : std::get_if<MatrixStage>(&aStages_.back());
        if (pLast == nullptr) {
            aStages_.emplace_back(stage);
            return;
        }
        Vector aOffset = stage.aOffset_;
        for (std::size_t i = 0; i < 3; ++i) {
            for (std::size_t j = 0; j < 3; ++j) {
                aOffset[i] += stage.aMatrix_[3 * i + j] * pLast->aOffset_[j];
            }
        }
        *pLast = {multiply(stage.aMatrix_, pLast->aMatrix_), aOffset};
    }
    void add(Matrix const& matrix) { add(MatrixStage{matrix, {}}); }
    void add(GridStage stage) { aStages_.emplace_back(std::move(stage)); }
    void add(ConnectionStage eStage) {
        bool const bBack = eStage == ConnectionStage::XYZ_TO_LAB && !aStages_.empty() &&
                           std::holds_alternative<ConnectionStage>(aStages_.back());
        if (bBack) {
            aStages_.pop_back();
        } else {
            aStages_.emplace_back(eStage);
        }
    }

    TableStages take() { return std::move(aStages_); }

private:
    TableStages aStages_;
};

bool addCurves(StageList& list, cmsToneCurve const* const* ppCurves, bool bReverse) {
    std::array<CurveHandle, 3> aCurves;
    for (std::size_t i = 0; i < 3; ++i) {
        aCurves[i] = ownCurve(bReverse ? cmsReverseToneCurve(ppCurves[i]) : cmsDupToneCurve(ppCurves[i]));
        if (aCurves[i] == nullptr) {
            return false;
        }
    }
    list.add(CurveStage{{curveFunction(aCurves[0]), curveFunction(aCurves[1]), curveFunction(aCurves[2])}});
    return true;
}

bool addGrid(StageList& list, _cmsStageCLutData const& data, bool bTrilinear) {
    GridStage stage{{}, bTrilinear, true, {}};
    std::size_t nNodes = 1;
    for (std::size_t i = 0; i < 3; ++i) {
        stage.aEdges_[i] = data.Params->nSamples[i];
        if (stage.aEdges_[i] < 2 || stage.aEdges_[i] > nMaxNodes / nNodes) {
            return false;
        }
        nNodes *= stage.aEdges_[i];
    }
    if (data.HasFloatValues != 0 || data.nEntries != 3 * nNodes) {
        return false;
    }
    // Theirs has the last channel fastest.
    auto const [nFirst, nSecond, nThird] = stage.aEdges_;
    stage.aNodes_.resize(3 * nNodes);
    for (std::size_t node = 0; node < nNodes; ++node) {
        std::size_t const first = node % nFirst;
        std::size_t const second = node / nFirst % nSecond;
        std::size_t const third = node / nFirst / nSecond;
        cmsUInt16Number const* const pEntry = data.Tab.T + 3 * ((first * nSecond + second) * nThird + third);
        for (std::size_t i = 0; i < 3; ++i) {
            stage.aNodes_[3 * node + i] = static_cast<float>(pEntry[i] / 65535.0);
        }
    }
    list.add(std::move(stage));
    return true;
}

bool addMatrix(StageList& list, _cmsStageMatrixData const& data) {
    MatrixStage stage{};
    std::copy_n(data.Double, 9, stage.aMatrix_.begin());
    if (data.Offset != nullptr) {
        std::copy_n(data.Offset, 3, stage.aOffset_.begin());
    }
    list.add(stage);
    return true;
}

bool addStage(StageList& list, cmsStage const* pStage, bool bTrilinear) {
    if (cmsStageInputChannels(pStage) != 3 || cmsStageOutputChannels(pStage) != 3) {
        return false;
    }
    void const* const pData = cmsStageData(pStage);
    auto const eType = cmsStageType(pStage);
    if (eType == cmsSigCurveSetElemType) {
        return addCurves(list, static_cast<_cmsStageToneCurvesData const*>(pData)->TheCurves, false);
    }
    if (eType == cmsSigMatrixElemType) {
        return addMatrix(list, *static_cast<_cmsStageMatrixData const*>(pData));
    }
    if (eType == cmsSigCLutElemType) {
        return addGrid(list, *static_cast<_cmsStageCLutData const*>(pData), bTrilinear);
    }
    return eType == cmsSigIdentityElemType;
}

bool addPipeline(StageList& list, cmsPipeline const* pPipeline, bool bTrilinear) {
    for (cmsStage const* pStage = cmsPipelineGetPtrToFirstStage(pPipeline); pStage != nullptr;
         pStage = cmsStageNext(pStage)) {
        if (!addStage(list, pStage, bTrilinear)) {
            return false;
        }
    }
    return true;
}

/// Whether a tag is of the kind whose Lab has its white at 65280.
bool hasOlderLab(cmsHPROFILE pProfile, cmsTagSignature eTag) {
    std::vector<unsigned char> aRaw(cmsReadRawTag(pProfile, eTag, nullptr, 0));
    auto const nBytes = static_cast<cmsUInt32Number>(aRaw.size());
    constexpr std::array<unsigned char, 4> aKind = {'m', 'f', 't', '2'};
    return nBytes >= aKind.size() && cmsReadRawTag(pProfile, eTag, aRaw.data(), nBytes) == nBytes &&
           std::equal(aKind.begin(), aKind.end(), aRaw.begin());
}

/// Which tag of a profile holds its tables for an intent, as the colour library chooses.
struct TablesOfProfile {
    cmsTagSignature eTag_;
    bool bFloats_; ///< it prefers a tag of floats
    bool bTables_;

    TablesOfProfile(Profile const& profile, std::uint32_t intent, bool bSource) : eTag_() {
        constexpr std::array aSource = {cmsSigAToB0Tag, cmsSigAToB1Tag, cmsSigAToB2Tag, cmsSigAToB1Tag};
        constexpr std::array aDestination = {cmsSigBToA0Tag, cmsSigBToA1Tag, cmsSigBToA2Tag, cmsSigBToA1Tag};
        constexpr std::array aSourceFloats = {cmsSigDToB0Tag, cmsSigDToB1Tag, cmsSigDToB2Tag, cmsSigDToB3Tag};
        constexpr std::array aDestinationFloats = {cmsSigBToD0Tag, cmsSigBToD1Tag, cmsSigBToD2Tag,
                                                   cmsSigBToD3Tag};
        auto const& aTags = bSource ? aSource : aDestination;
        std::size_t const iIntent = std::min<std::size_t>(intent, aTags.size() - 1);
        bFloats_ = cmsIsTag(profile.handle(), (bSource ? aSourceFloats : aDestinationFloats)[iIntent]) != 0;
        eTag_ = cmsIsTag(profile.handle(), aTags[iIntent]) != 0 ? aTags[iIntent] : aTags[0];
        bTables_ = cmsIsTag(profile.handle(), eTag_) != 0;
    }
};

bool addSource(StageList& list, Profile const& profile, std::uint32_t intent) {
    TablesOfProfile const tables(profile, intent, true);
    if (tables.bFloats_) {
        return false;
    }
    if (!tables.bTables_) {
        auto const tags = readTags(profile);
        if (!tags.has_value()) {
            return false;
        }
        bool const bAdded = addCurves(list, tags->aCurves_.data(), false);
        list.add(tags->toXYZ_);
        return bAdded;
    }
    bool const bLab = cmsGetPCS(profile.handle()) == cmsSigLabData;
    bool const bOlder = bLab && hasOlderLab(profile.handle(), tables.eTag_);
    auto const* const pPipeline = static_cast<cmsPipeline const*>(cmsReadTag(profile.handle(), tables.eTag_));
    if (pPipeline == nullptr || !addPipeline(list, pPipeline, false)) {
        return false;
    }
    if (bOlder) {
        list.add(diagonal(1.0 / dOlderLab, 1.0 / dOlderLab, 1.0 / dOlderLab));
    }
    if (bLab) {
        list.add(ConnectionStage::LAB_TO_XYZ);
    } else {
        list.add(diagonal(dEncodedXYZ, dEncodedXYZ, dEncodedXYZ));
    }
    return true;
}

bool addDestination(StageList& list, Profile const& profile, std::uint32_t intent) {
    TablesOfProfile const tables(profile, intent, false);
    if (tables.bFloats_) {
        return false;
    }
    if (!tables.bTables_) {
        auto const tags = readTags(profile);
        auto const toDevice = tags.has_value() ? fromXYZ(profile, *tags) : std::nullopt;
        if (!toDevice.has_value()) {
            return false;
        }
        list.add(*toDevice);
        return addCurves(list, tags->aCurves_.data(), true);
    }
    bool const bLab = cmsGetPCS(profile.handle()) == cmsSigLabData;
    bool const bOlder = bLab && hasOlderLab(profile.handle(), tables.eTag_);
    if (bLab) {
        list.add(ConnectionStage::XYZ_TO_LAB);
    } else {
        list.add(diagonal(1.0 / dEncodedXYZ, 1.0 / dEncodedXYZ, 1.0 / dEncodedXYZ));
    }
    if (bOlder) {
        list.add(diagonal(dOlderLab, dOlderLab, dOlderLab));
    }
    auto const* const pPipeline = static_cast<cmsPipeline const*>(cmsReadTag(profile.handle(), tables.eTag_));
    // Over Lab, in which the greys are one axis and not the diagonal, the colour library goes by cells.
    return pPipeline != nullptr && addPipeline(list, pPipeline, bLab);
}

/// Puts the darkest colour of the source in the place of the destination's, and leaves white where it is.
void addBlackPoint(StageList& list, Profile const& source, Profile const& destination, std::uint32_t intent) {
    cmsCIEXYZ from{};
    cmsCIEXYZ to{};
    cmsDetectBlackPoint(&from, source.handle(), intent, 0);
    cmsDetectDestinationBlackPoint(&to, destination.handle(), intent, 0);
    if (from.X == to.X && from.Y == to.Y && from.Z == to.Z) {
        return;
    }
    Vector const aFrom = {from.X, from.Y, from.Z};
    Vector const aTo = {to.X, to.Y, to.Z};
    MatrixStage stage{};
    for (std::size_t i = 0; i < 3; ++i) {
        double const white = CONNECTION_WHITE[i];
        stage.aMatrix_[4 * i] = (white - aTo[i]) / (white - aFrom[i]);
        stage.aOffset_[i] = white * (aTo[i] - aFrom[i]) / (white - aFrom[i]);
    }
    list.add(stage);
}

void addConnection(StageList& list, Profile const& source, Profile const& destination, std::uint32_t intent,
                   std::uint32_t options) {
    if (intent == INTENT_ABSOLUTE_COLORIMETRIC) {
        Matrix const matrix = whiteScale(source, destination);
        if (matrix != diagonal(1.0, 1.0, 1.0)) {
            list.add(matrix);
        }
        return;
    }
    // Profiles of version 4 have a black of their own for these intents, which always is taken into account.
    bool const bOfVersion4 = (intent == INTENT_PERCEPTUAL || intent == INTENT_SATURATION) &&
                             cmsGetEncodedICCversion(destination.handle()) >= 0x4000000U;
    if (bOfVersion4 || (options & TRANSFORM_BLACK_POINT_COMPENSATION) != 0) {
        addBlackPoint(list, source, destination, intent);
    }
}

} // namespace

std::optional<TableStages> extractStages(Profile const& source, Profile const& destination,
                                         std::uint32_t intent, std::uint32_t options) {
    StageList list;
    if (!addSource(list, source, intent)) {
        return std::nullopt;
    }
    addConnection(list, source, destination, intent, options);
    if (!addDestination(list, destination, intent)) {
        return std::nullopt;
    }
    return list.take();
}

} // namespace ORVO::ColourEngine::Internal
