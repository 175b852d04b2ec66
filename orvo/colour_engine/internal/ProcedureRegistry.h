#pragma once

#include <cstdint>
#include <map>
#include <shared_mutex>
#include <string>

namespace ORVO::ColourEngine::Internal {

/// One procedure of the engine and its three names.
struct ProcedureEntry {
    char const* pInterface;
    char const* pSelector;
    char const* pProcName;
    void* pProcedure;
};

/// The procedures that can be asked for by name: the engine's own from the start, and what clients register.
///
/// Threads: any.
class ProcedureRegistry {
public:
    /// The engine's registry; never destroyed.
    static ProcedureRegistry& instance();

    /// Null for what is not there.
    void* find(char const* pInterface, char const* pSelector, char const* pProcName);
    /// Adds a procedure or replaces it.
    void add(ProcedureEntry const& entry);
    /// Takes all procedures of an interface away and raises the counter; false, and nothing raised, if there
    /// is none.
    bool removeInterface(char const* pInterface);

    /// To be read atomically.
    std::uint32_t* removalCount() noexcept { return &nRemovals_; }

private:
    ProcedureRegistry();

    using Procedures = std::map<std::string, void*, std::less<>>; // by selector and name
    std::shared_mutex oLock_;
    std::map<std::string, Procedures, std::less<>> aInterfaces_;
    alignas(4) std::uint32_t nRemovals_ = 0;
};

} // namespace ORVO::ColourEngine::Internal
