#pragma once

#include "orvo/core/Export.h"

#include <cstdint>
#include <string>

namespace ORVO::FilterGraph {

/// A named item with a type that is known at run time: the common part of parameters and metadata items.
///
/// Threads: as `IFilter`.
class ORVO_API DataItemBase {
public:
    enum teType : std::int32_t {
        TYPE_BOOL = 0,
        TYPE_BOOL2 = 1,
        TYPE_BOOL3 = 2,
        TYPE_BOOL4 = 3,
        TYPE_INT = 4,
        TYPE_INT2 = 5,
        TYPE_INT3 = 6,
        TYPE_INT4 = 7,
        TYPE_FLOAT = 8,
        TYPE_FLOAT2 = 9,
        TYPE_FLOAT3 = 10,
        TYPE_FLOAT4 = 11,
        TYPE_FLOAT2X2 = 12,
        TYPE_FLOAT3X3 = 13,
        TYPE_FLOAT4X4 = 14,
        TYPE_FLOAT_VECTOR = 15, ///< std::vector<float>
        TYPE_STRING = 16,       ///< std::string; no type bears the value 17
        TYPE_POINTER = 18,      ///< void*
    };

    virtual ~DataItemBase();

    DataItemBase(DataItemBase const&) = delete;
    DataItemBase& operator=(DataItemBase const&) = delete;

    std::string const& name() const { return sName_; }

    teType type() const { return eType_; }

protected:
    DataItemBase(std::string const& name, teType type);

private:
    teType eType_;
    std::string sName_;
};

} // namespace ORVO::FilterGraph
