#pragma once

#include "orvo/core/math/Bool.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/math/Int.h"
#include "orvo/core/math/Matrix.h"
#include "orvo/filter_graph/impl/DataItemBase.h"

#include <string>
#include <vector>

namespace ORVO::FilterGraph {

/// The run-time tag of each type that a parameter or a metadata item can hold: `DataItemType<float>::value`
/// is `DataItemBase::TYPE_FLOAT`. Other types have none and do not compile.
template <class T>
struct DataItemType;

template <DataItemBase::teType Tag>
struct DataItemTag {
    static constexpr DataItemBase::teType value = Tag;
};

// clang-format off
template <> struct DataItemType<bool> : DataItemTag<DataItemBase::TYPE_BOOL> {};
template <> struct DataItemType<bool2> : DataItemTag<DataItemBase::TYPE_BOOL2> {};
template <> struct DataItemType<bool3> : DataItemTag<DataItemBase::TYPE_BOOL3> {};
template <> struct DataItemType<bool4> : DataItemTag<DataItemBase::TYPE_BOOL4> {};
template <> struct DataItemType<int> : DataItemTag<DataItemBase::TYPE_INT> {};
template <> struct DataItemType<int2> : DataItemTag<DataItemBase::TYPE_INT2> {};
template <> struct DataItemType<int3> : DataItemTag<DataItemBase::TYPE_INT3> {};
template <> struct DataItemType<int4> : DataItemTag<DataItemBase::TYPE_INT4> {};
template <> struct DataItemType<float> : DataItemTag<DataItemBase::TYPE_FLOAT> {};
template <> struct DataItemType<float2> : DataItemTag<DataItemBase::TYPE_FLOAT2> {};
template <> struct DataItemType<float3> : DataItemTag<DataItemBase::TYPE_FLOAT3> {};
template <> struct DataItemType<float4> : DataItemTag<DataItemBase::TYPE_FLOAT4> {};
template <> struct DataItemType<float2x2> : DataItemTag<DataItemBase::TYPE_FLOAT2X2> {};
template <> struct DataItemType<float3x3> : DataItemTag<DataItemBase::TYPE_FLOAT3X3> {};
template <> struct DataItemType<float4x4> : DataItemTag<DataItemBase::TYPE_FLOAT4X4> {};
template <> struct DataItemType<std::vector<float>> : DataItemTag<DataItemBase::TYPE_FLOAT_VECTOR> {};
template <> struct DataItemType<std::string> : DataItemTag<DataItemBase::TYPE_STRING> {};
template <> struct DataItemType<void*> : DataItemTag<DataItemBase::TYPE_POINTER> {};
// clang-format on

} // namespace ORVO::FilterGraph

/// Expands `X(T)` for every type that has a tag, in the order of the tags.
#define ORVO_FOR_EACH_DATA_ITEM_TYPE(X)                                                                      \
    X(bool)                                                                                                  \
    X(::ORVO::bool2)                                                                                         \
    X(::ORVO::bool3)                                                                                         \
    X(::ORVO::bool4)                                                                                         \
    X(int)                                                                                                   \
    X(::ORVO::int2)                                                                                          \
    X(::ORVO::int3)                                                                                          \
    X(::ORVO::int4)                                                                                          \
    X(float)                                                                                                 \
    X(::ORVO::float2)                                                                                        \
    X(::ORVO::float3)                                                                                        \
    X(::ORVO::float4)                                                                                        \
    X(::ORVO::float2x2)                                                                                      \
    X(::ORVO::float3x3)                                                                                      \
    X(::ORVO::float4x4)                                                                                      \
    X(std::vector<float>)                                                                                    \
    X(std::string)                                                                                           \
    X(void*)
