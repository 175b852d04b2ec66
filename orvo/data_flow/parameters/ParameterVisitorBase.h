#pragma once

#include "orvo/core/Export.h"

#include <string>

namespace ORVO {
struct bool2;
struct bool3;
struct bool4;
struct int2;
struct int3;
struct int4;
struct float2;
struct float3;
struct float4;
struct float2x2;
struct float3x3;
struct float4x4;
} // namespace ORVO

namespace ORVO::DataFlow {

class ParameterBase;
template <typename T>
class Parameter;

/// Does something by the type of a parameter: `ParameterBase::visit` calls the overload that fits. Types
/// without an overload of their own (unsigned and long integers, pointers, sequences, enumerations,
/// rectangles) come through the first. A bounded parameter is visited as the plain parameter of its type.
///
/// Threads: as the implementation says.
class ORVO_API ParameterVisitorBase {
public:
    ParameterVisitorBase() = default;
    ParameterVisitorBase(ParameterVisitorBase const&) = default;
    ParameterVisitorBase& operator=(ParameterVisitorBase const&) = default;
    virtual ~ParameterVisitorBase();

    // Each takes the parameter that is visited, which is not owned and not null.
    virtual void visit(ParameterBase* pParameter) = 0;
    virtual void visit(Parameter<std::string>* pParameter) = 0;
    virtual void visit(Parameter<float4x4>* pParameter) = 0;
    virtual void visit(Parameter<float3x3>* pParameter) = 0;
    virtual void visit(Parameter<float2x2>* pParameter) = 0;
    virtual void visit(Parameter<float4>* pParameter) = 0;
    virtual void visit(Parameter<float3>* pParameter) = 0;
    virtual void visit(Parameter<float2>* pParameter) = 0;
    virtual void visit(Parameter<float>* pParameter) = 0;
    virtual void visit(Parameter<bool4>* pParameter) = 0;
    virtual void visit(Parameter<bool3>* pParameter) = 0;
    virtual void visit(Parameter<bool2>* pParameter) = 0;
    virtual void visit(Parameter<bool>* pParameter) = 0;
    virtual void visit(Parameter<int4>* pParameter) = 0;
    virtual void visit(Parameter<int3>* pParameter) = 0;
    virtual void visit(Parameter<int2>* pParameter) = 0;
    virtual void visit(Parameter<int>* pParameter) = 0;
};

} // namespace ORVO::DataFlow
