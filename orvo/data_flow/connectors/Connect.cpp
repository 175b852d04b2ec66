#include "orvo/data_flow/connectors/Connect.h"

#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"

#include "orvo/core/Check.h"

#include <cstring>

namespace ORVO::DataFlow {

bool ConnectorsAreCompatible(Connector const& oFirst, Connector const& oSecond) {
    // Each module may have its own type record of one type, so records are not compared by address.
    return std::strcmp(oFirst.datatype().name(), oSecond.datatype().name()) == 0;
}

void Connect(InputConnector& in, OutputConnector& out) {
    ORVO_CHECK(ConnectorsAreCompatible(out, in));
    if (OutputConnector* const pFormerOutput = in.connectedOutput()) {
        pFormerOutput->connectWith(nullptr);
        in.connectWith(nullptr);
    }
    if (InputConnector* const pFormerInput = out.connectedInput()) {
        pFormerInput->connectWith(nullptr);
    }
    in.connectWith(&out);
    out.connectWith(&in);
}

void Connect(OutputConnector& out, InputConnector& in) { Connect(in, out); }

} // namespace ORVO::DataFlow
