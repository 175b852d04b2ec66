// A module that is loaded at run time with symbols of its own.

#include "tests/data_flow/modules/ModuleNode.h"

#include "orvo/core/Check.h"
#include "orvo/core/math/Float.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"

#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::DataFlow;
using ORVO::Test::SharedPayload;

class ModuleNode : public Node {
public:
    ModuleNode() : Node("module") {
        registerParameter(&oOffset_);
        registerParameter(&oSize_);
        registerParameter(&oPoints_);
        addInput(&oInput_);
        addOutput(&oColour_);
        addOutput(&oPayload_);
    }
    ~ModuleNode() override { disconnect(); }

protected:
    void internalProcess() override {
        float2 const& oOffset = oOffset_.value();
        oColour_.setData(ORVO_NEW float4(oOffset.x, oOffset.y, 0.0f, 1.0f));
        oInput_->iValue_ += 1;
        ConstDataPointer<SharedPayload> spPayload;
        oInput_.moveTo(spPayload);
        oPayload_ = spPayload;
    }

private:
    Parameter<float2> oOffset_{float2(0.0f), "offset"};
    IntervalParameter<int> oSize_{1, 0, 9, "size"};
    Parameter<std::vector<float2>> oPoints_{{}, "points"};
    Input<SharedPayload> oInput_{"payload", this};
    ConstOutput<float4> oColour_{"colour", this};
    ConstOutput<SharedPayload> oPayload_{"payload", this};
};

} // namespace

extern "C" __attribute__((visibility("default"))) Node* createModuleNode() { return new ModuleNode; }

extern "C" __attribute__((visibility("default"))) void destroyModuleNode(Node* pNode) { delete pNode; }

extern "C" __attribute__((visibility("default"))) void failInModule() { ORVO_CHECK(false, "module"); }
