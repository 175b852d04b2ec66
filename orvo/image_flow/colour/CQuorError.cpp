#include "orvo/image_flow/colour/CQuorError.h"

#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/QuorInterfaces.h"

namespace Quor_T_MT {

namespace {

using namespace ORVO;
using ImageFlow::freshProcedure;
using ImageFlow::quorErrorInterface;

std::string messageOf(QuorError* pError) {
    auto* const pGetMessage = freshProcedure<QuorGetErrorMessageProc>(
        quorErrorInterface(), ImageFlow::QUOR_ERROR_GET_ERROR_MESSAGE);
    char const* pText = nullptr;
    if (pError == nullptr || pGetMessage == nullptr || pGetMessage(pError, &pText) != 0 || pText == nullptr) {
        return "Invalid CQuorError";
    }
    return pText;
}

} // namespace

CQuorError::CQuorError(QuorError* pError)
    : pError_(pError), iGeneration_(ImageFlow::QuorClient::generation()), sText_(messageOf(pError)) {
    addReference();
}

CQuorError::CQuorError(char const* pText)
    : pError_(nullptr), iGeneration_(ImageFlow::QuorClient::generation()), sText_(pText) {}

CQuorError::CQuorError(CQuorError const& other)
    : std::exception(other), pError_(other.pError_), iGeneration_(other.iGeneration_), sText_(other.sText_) {
    addReference();
}

CQuorError& CQuorError::operator=(CQuorError const& other) {
    if (this != &other) {
        std::string sText = other.sText_;
        dropReference();
        pError_ = other.pError_;
        iGeneration_ = other.iGeneration_;
        sText_.swap(sText);
        addReference();
    }
    return *this;
}

CQuorError::~CQuorError() { dropReference(); }

char const* CQuorError::what() const noexcept { return sText_.c_str(); }

QuorError* CQuorError::error() const noexcept { return pError_; }

void CQuorError::addReference() noexcept {
    auto* const pAddRef =
        freshProcedure<QuorErrorAddRefProc>(quorErrorInterface(), ImageFlow::QUOR_ERROR_ADD_REF);
    if (pError_ != nullptr && pAddRef != nullptr && iGeneration_ == ImageFlow::QuorClient::generation()) {
        pAddRef(pError_);
    }
}

void CQuorError::dropReference() noexcept {
    auto* const pRelease =
        freshProcedure<QuorErrorReleaseProc>(quorErrorInterface(), ImageFlow::QUOR_ERROR_RELEASE);
    if (pError_ != nullptr && pRelease != nullptr && iGeneration_ == ImageFlow::QuorClient::generation()) {
        pRelease(pError_);
    }
}

void throwQuorError(VantleResult result) { throw CQuorError(reinterpret_cast<QuorError*>(result)); }

void checkQuorResult(VantleResult result) {
    if (result != 0) {
        throwQuorError(result);
    }
}

} // namespace Quor_T_MT
