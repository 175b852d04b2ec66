#pragma once

#include "orvo/core/CoreLibrary.h"
#include "orvo/core/Export.h"

namespace ORVO::ImageFlow {

/// Opens the binding to the colour engine and closes it again.
///
/// Threads: the thread that starts the layers.
class ORVO_API ScopedQuorInitializer {
public:
    ScopedQuorInitializer() noexcept = default;
    /// Closes the binding if it is open.
    ~ScopedQuorInitializer();

    ScopedQuorInitializer(ScopedQuorInitializer const&) = delete;
    ScopedQuorInitializer& operator=(ScopedQuorInitializer const&) = delete;

    /// Starts the client with this address procedure, unless it is open already. Throws `InternalException`
    /// "nResult != 0" where the start fails; nothing is open then.
    void initialize(QuorGetAddressProc pProc);
    /// Stops the client if it is open.
    void terminate() noexcept;
    bool isInitialized() const noexcept;

private:
    bool bInitialized_ = false;
};

} // namespace ORVO::ImageFlow
