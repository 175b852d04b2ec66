#pragma once

#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/core/Export.h"
#include "orvo/image_flow/colour/QuorTable.h"

#include <cstdint>

namespace ORVO {

/// The client of "VantleInterface2", the colour engine proper: the nine operations that the system calls, by
/// the names that the engine gives them, each behind a guard. The operations return the engine's result: 0 or
/// an error handle, which `Quor_T_MT::checkQuorResult` turns into an exception.
///
/// Every operation but isAvailable() and table() throws `TrelException` "couldn't init CVantle" where no
/// engine can be reached.
///
/// Threads: any.
class ORVO_API CVantle {
public:
    CVantle() = delete;

    /// Whether the engine can be reached now, without throwing.
    static bool isAvailable() noexcept;

    /// The table behind the operations, of 150 slots: for whoever binds or serves the interface by slots.
    static ImageFlow::QuorTable const& table() noexcept;

    /// Makes a profile from a four-character or numeric code.
    static VantleResult ProfileFromCode(VantleProfile** pOut, std::uint32_t code);
    static VantleResult UnReferenceProfile(VantleProfile* pProfile);
    static VantleResult UnReferenceString(VantleString* pString);
    /// Copies at most `capacity` bytes of text, without an end mark; with a null buffer it reports the length
    /// alone.
    static VantleResult StringASCII(VantleString* pString, char* pBuffer, std::uint32_t* pSize,
                                    std::uint32_t capacity);
    static VantleResult MakeColorTransform(VantleTransform** pOut, VantleProfile* pSource,
                                           VantleProfile* pDestination, std::uint32_t intent,
                                           std::uint32_t options);
    static VantleResult ReferenceTransform(VantleTransform* pTransform);
    static VantleResult UnReferenceTransform(VantleTransform* pTransform);
    static VantleResult ApplyGeneral(VantleTransform* pTransform, _t_Vantle_PackingSpec const* pSource,
                                     _t_Vantle_PackingSpec const* pDestination, std::uint32_t rows,
                                     std::uint32_t columns, _t_Vantle_Options const* pOptions);
    /// Gives a faster equivalent: with the embedded engine the same handle again, its count raised, for the
    /// same profiles, intent and options.
    static VantleResult OptimizeTransform(VantleTransform** pOut, VantleTransform* pTransform,
                                          std::uint32_t options);

    /// The whole road from two codes to an optimised transform with the absolute intent, everything else
    /// released. Returns the first result that is not 0, with `*pOut` null and nothing left referenced. Where
    /// the engine goes away midway, `TrelException` comes out, and references are dropped if it is back.
    static VantleResult makeTransform(VantleTransform** pOut, std::uint32_t sourceCode,
                                      std::uint32_t destinationCode);
};

} // namespace ORVO
