#pragma once

#include "orvo/colour_engine/VantleHandles.h"
#include "orvo/core/Export.h"

#include <cstdint>
#include <exception>
#include <string>

namespace Quor_T_MT {

/// A procedure of the colour engine, or of the layer below it, failed. Holds a reference on the error object
/// and its text. Outside the family of `ORVO::ExceptionBase`.
///
/// Threads: as any value; the reference is dropped while the engine that it came from is bound, else let go.
class ORVO_API CQuorError : public std::exception {
public:
    /// Takes a reference on the object; its text comes from the engine's `GetErrorMessage`. Null or an object
    /// that the engine does not know has the text "Invalid CQuorError".
    explicit CQuorError(ORVO::QuorError* pError);
    /// A failure of the binding itself, with no object: "Missing Interface". The layer has one more text of
    /// this kind, "Memory Copy Error", for clients that copy memory by its procedures; none here does.
    explicit CQuorError(char const* pText);
    CQuorError(CQuorError const& other);
    CQuorError& operator=(CQuorError const& other);
    ~CQuorError() override;

    char const* what() const noexcept override;
    /// The error object, null for a failure of the binding itself.
    ORVO::QuorError* error() const noexcept;

private:
    void addReference() noexcept;
    void dropReference() noexcept;

    ORVO::QuorError* pError_;
    std::uint32_t iGeneration_; ///< of the binding that the object belongs to
    std::string sText_;
};

/// Throws the `CQuorError` of a non-zero result.
[[noreturn]] ORVO_API void throwQuorError(ORVO::VantleResult result);

/// Does nothing for 0, else throws the `CQuorError` of the result.
ORVO_API void checkQuorResult(ORVO::VantleResult result);

} // namespace Quor_T_MT
