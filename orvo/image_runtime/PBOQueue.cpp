#include "orvo/image_runtime/PBOQueue.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_runtime/SampleQueries.h"
#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

#include <algorithm>
#include <cstdint>
#include <stdexcept>

namespace ORVO {

namespace {

/// Buffers are made in steps of this size, and one that is larger than asked for by more is not taken.
constexpr std::int64_t nPBOStep = 0x40000;
constexpr std::size_t nMaximumPBOBytes = 0x8000000;

OGL::FunctionTable const& gl() noexcept { return *OGL::ExtensionManager::Instance()->table(); }

bool isQuery(unsigned nQuery) noexcept { return gl().glIsQuery(nQuery) != GL_FALSE; }

} // namespace

PBOQueue::PBOQueue() = default;
PBOQueue::~PBOQueue() { clear(); }

bool PBOQueue::isOfCurrentContext(Entry const& entry) noexcept {
    return entry.pContext_ == OGL::NativeContext::currentHandle();
}

PBOQueue::Entries::iterator PBOQueue::findFree(unsigned sizeInBytes) {
    unsigned const nCurrent = currentSampleQuery();
    auto const isFree = [nCurrent, sizeInBytes](Entry const& entry) {
        long long const nExcess = entry.pBuffer_->size() - static_cast<long long>(sizeInBytes);
        if (entry.bOutstanding_ || nExcess < 0 || nExcess > nPBOStep)
            return false;
        // A number of another context's query says nothing here, and one that is active must not be asked.
        if (!isOfCurrentContext(entry))
            return true;
        if (entry.nQuery_ == nCurrent)
            return false;
        if (!isQuery(entry.nQuery_))
            return true;
        GLuint nAvailable = GL_FALSE;
        gl().glGetQueryObjectuiv(entry.nQuery_, GL_QUERY_RESULT_AVAILABLE, &nAvailable);
        return nAvailable != GL_FALSE;
    };
    return std::find_if(oEntries_.begin(), oEntries_.end(), isFree);
}

PBOQueue::Entries::iterator PBOQueue::append(unsigned sizeInBytes) {
    if (oEntries_.size() == oEntries_.max_size())
        throw std::length_error("list<T> too long");
    long long const nBytes = (static_cast<long long>(sizeInBytes) + nPBOStep - 1) / nPBOStep * nPBOStep;
    ScopedPtr<OGL::Buffer> pBuffer(ORVO_NEW OGL::Buffer(nBytes, OGL::Buffer::TYPE_PIXEL_UNPACK,
                                                        OGL::Buffer::USAGE_STREAM_DRAW, nullptr));
    oEntries_.push_back(Entry{pBuffer.get(), 0, false, false, nullptr});
    static_cast<void>(pBuffer.release());
    nPBOBytes_ += static_cast<std::size_t>(nBytes);
    return std::prev(oEntries_.end());
}

void PBOQueue::beginQuery(Entry& entry) {
    unsigned const nCurrent = currentSampleQuery();
    if (nCurrent != 0 && isQueueQuery(nCurrent))
        gl().glEndQuery(GL_SAMPLES_PASSED);
    entry.bBegun_ = !isAnySampleQueryActive();
    if (entry.bBegun_)
        gl().glBeginQuery(GL_SAMPLES_PASSED, entry.nQuery_);
    ORVO_OGL_THROW_ON_ERROR("The query of an upload could not be begun");
}

bool PBOQueue::isQueueQuery(unsigned nQuery) const noexcept {
    return std::any_of(oEntries_.begin(), oEntries_.end(), [nQuery](Entry const& entry) {
        return entry.bBegun_ && entry.nQuery_ == nQuery && isOfCurrentContext(entry);
    });
}

OGL::Buffer* PBOQueue::take(unsigned sizeInBytes, unsigned queryID) {
    ORVO_CHECK_PARAMETER(queryID != 0);
    ORVO_OGL_REQUIRE_CONTEXT();
    auto entry = findFree(sizeInBytes);
    if (entry == oEntries_.end())
        entry = append(sizeInBytes);
    Entry taken{entry->pBuffer_, queryID, true, false, OGL::NativeContext::currentHandle()};
    beginQuery(taken);
    *entry = taken;
    oEntries_.splice(oEntries_.end(), oEntries_, entry);
    return taken.pBuffer_;
}

void PBOQueue::giveBack(OGL::Buffer* pBuffer) {
    ORVO_ENFORCE(pBuffer);
    ORVO_CHECK(!pBuffer->isBound());
    ORVO_CHECK(!oEntries_.empty(), "Buffer never created in Pool");
    auto const back = std::prev(oEntries_.end());
    ORVO_CHECK(back->pBuffer_ == pBuffer, "Buffer NOT the last one taken from the queue");
    ORVO_CHECK(isOfCurrentContext(*back) && (!back->bBegun_ || isQuery(back->nQuery_)),
               "Context has changed since buffer was taken from Pool");

    bool const bActive = back->bBegun_ && back->nQuery_ == currentSampleQuery();
    back->bOutstanding_ = false;
    // Buffers that are still in use are the ones taken last, so that they can be given back in turn.
    auto const isInUse = [](Entry const& entry) { return entry.bOutstanding_; };
    oEntries_.splice(std::find_if(oEntries_.begin(), back, isInUse), oEntries_, back);
    if (bActive) {
        gl().glEndQuery(GL_SAMPLES_PASSED);
        ORVO_OGL_THROW_ON_ERROR("The query of an upload could not be ended");
    }
    enforceBudget();
}

void PBOQueue::enforceBudget() {
    unsigned const nCurrent = currentSampleQuery();
    for (auto entry = oEntries_.begin(); entry != oEntries_.end() && nPBOBytes_ > nMaximumPBOBytes;) {
        auto const oldest = entry++;
        if (oldest->bOutstanding_)
            continue;
        // An active query would never have a result.
        if (oldest->bBegun_ && isOfCurrentContext(*oldest) && oldest->nQuery_ != nCurrent &&
            isQuery(oldest->nQuery_)) {
            GLuint nSamples = 0;
            gl().glGetQueryObjectuiv(oldest->nQuery_, GL_QUERY_RESULT, &nSamples);
        }
        remove(oldest);
    }
}

void PBOQueue::remove(Entries::iterator entry) noexcept {
    nPBOBytes_ -= static_cast<std::size_t>(entry->pBuffer_->size());
    trackedDelete(entry->pBuffer_);
    oEntries_.erase(entry);
}

void PBOQueue::deleteQueries() noexcept {
    if (OGL::NativeContext::currentHandle() == nullptr)
        return;
    for (Entry& entry : oEntries_) {
        if (!entry.bBegun_ || !isOfCurrentContext(entry) || !isQuery(entry.nQuery_))
            continue;
        if (entry.nQuery_ == currentSampleQuery())
            gl().glEndQuery(GL_SAMPLES_PASSED);
        gl().glDeleteQueries(1, &entry.nQuery_);
        entry.bBegun_ = false;
    }
}

void PBOQueue::clear() noexcept {
    while (!oEntries_.empty())
        remove(oEntries_.begin());
}

} // namespace ORVO
