#include "orvo/filter_graph/impl/Output.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/internal/InputSet.h"

namespace ORVO::FilterGraph {

Output::Output() : consumers_(std::make_unique<Internal::InputSet>()) {}

Output::Output(IFilter* pParentFilter, std::string const& name, std::size_t nChannel)
    : nChannel_(nChannel),
      name_(name),
      parentFilter_(pParentFilter),
      consumers_(std::make_unique<Internal::InputSet>()) {
    ORVO_CHECK(pParentFilter != nullptr, "Need valid parent filter.");
}

Output::~Output() {
    for (Input* pConsumer : consumers_->inputs())
        pConsumer->setProducer(nullptr);
}

Output* Output::clone(IFilter* pNewParent) const { return ORVO_NEW Output(pNewParent, name_, nChannel_); }

std::size_t Output::numConsumerInputs() const {
    ORVO_ENFORCE(consumers_);
    return consumers_->size();
}

InputIterator Output::consumerInputs() {
    ORVO_ENFORCE(consumers_);
    return consumers_->inputs();
}

InputConstIterator Output::consumerInputs() const {
    ORVO_ENFORCE(consumers_);
    return static_cast<Internal::InputSet const&>(*consumers_).inputs();
}

void Output::insertConsumer(Input* pInput) {
    ORVO_ENFORCE(consumers_);
    consumers_->insert(pInput);
}

void Output::removeConsumer(Input* pInput) {
    ORVO_ENFORCE(consumers_);
    consumers_->remove(pInput);
}

} // namespace ORVO::FilterGraph
