// A module that is loaded at run time with symbols of its own.
#include "tests/filter_graph/modules/FilterModule.h"

#include "orvo/core/exceptions/InternalException.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Exception.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"

#define ORVO_TEST_EXPORT extern "C" __attribute__((visibility("default")))

namespace {

using namespace ORVO;
using namespace ORVO::FilterGraph;

class ModuleFilter : public Internal::Filter {
public:
    ModuleFilter() {
        setIdentifier(Identifier("module filter", "test", "ORVO", 1));
        addInput("src", 3);
        addParameter(OwnedParameter(ORVO_NEW Parameter<float2>("offset", float2(1.0F, 2.0F), false)));
        addParameter(OwnedParameter(ORVO_NEW Parameter<std::string>("title", "module", false)));
        addMetadataItem(ORVO_NEW MetadataItem<float3>("Corner", float3(1.0F, 2.0F, 3.0F)));
    }

    std::shared_ptr<Filter> clone() override { return std::make_shared<ModuleFilter>(*this); }

    std::shared_ptr<Internal::IFilterExecutable> buildFilterExecutable(TargetPlatform,
                                                                       Internal::GraphExecutable&) override {
        return nullptr;
    }
};

bool recognisesFailedCheck() {
    try {
        FilterFactory::Instance()->create(Identifier("no such filter", "test", "ORVO"));
    } catch (InternalException const&) {
        return true;
    } catch (...) {
    }
    return false;
}

bool recognisesMismatch() {
    auto const source = std::make_shared<ModuleFilter>();
    source->output()->setNumChannels(1);
    auto const target = std::make_shared<ModuleFilter>();
    try {
        Connect(source, target);
    } catch (Exception const& exception) {
        return exception.errorsAndWarnings().size() == 1;
    } catch (...) {
    }
    return false;
}

} // namespace

ORVO_TEST_EXPORT void insertModuleFilter() { FilterFactory::Instance()->insert(ModuleFilter()); }

ORVO_TEST_EXPORT void removeModuleFilter() {
    FilterFactory::Instance()->remove(Identifier("module filter", "test", "ORVO", 1));
}

ORVO_TEST_EXPORT void throwInModule() {
    Exception exception("from the module");
    exception.add(ErrorOrWarningInfo(ErrorOrWarningInfo::ERROR_TYPE_WARNING, "and more", 0, 0));
    throw exception;
}

ORVO_TEST_EXPORT bool catchInModule() { return recognisesFailedCheck() && recognisesMismatch(); }
