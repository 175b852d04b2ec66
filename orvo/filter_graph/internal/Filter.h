#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/impl/OptimizationOptions.h"
#include "orvo/filter_graph/internal/IExecutableBuilder.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ORVO::FilterGraph::Internal {

class InputSet;
class ParameterForwarder;
class ParameterSet;

/// The base of all filters. It holds what they share: identity, inputs, output, parameters and metadata, the
/// time stamps by which a processor notices a changed graph, the mark of the traversal, and the clone that
/// turns a filter of the client graph into one of the intermediate graph.
///
/// A concrete filter supplies `clone` and the two operations of `IExecutableBuilder`, and sets itself up in
/// its constructor, or, where that is costly, in `finishLazyInitialization`:
///
///     Blur::Blur()
///     {
///         setIdentifier(Identifier("blur", "example", "me", 1));
///         addInput("src", 0);
///         addParameter(OwnedParameter(new Parameter<float>("radius", 1.0f, false)));
///     }
///
/// Ownership of parameters: those that the filter is given as `OwnedParameter`, and those of a copy, die with
/// the filter at the latest. Those that a subclass adds by plain pointer are its own to delete, by
/// `deleteAllParameters` or in another way.
///
/// Threads: as `IFilter`.
class ORVO_API Filter : public IFilter, public IExecutableBuilder {
public:
    using OwnedParameter = std::unique_ptr<ParameterBase, ORVODeleter<ParameterBase>>;

    /// Disconnects both sides and deletes inputs, output and metadata. Never throws.
    ~Filter() override;

    Identifier const& identifier() const override;
    std::size_t nChannel() const override;
    InputConstIterator inputs() const override;
    InputIterator inputs() override;
    Input const* input(std::string const& name) const override;
    Input* input(std::string const& name) override;
    std::size_t getNumberOfInputs() const override;
    Output const* output(std::string const& name) const override;
    Output* output(std::string const& name) override;
    Output const* output() const override;
    Output* output() override;
    ParameterConstIterator parameters() const override;
    ParameterIterator parameters() override;
    ParameterBase const* parameter(std::string const& name) const override;
    ParameterBase* parameter(std::string const& name) override;
    std::size_t getNumberOfParameters() const override;
    MetadataConstIterator metadata() const override;
    MetadataItemBase const* metadataItem(std::string const& name) const override;
    std::size_t getNumberOfMetadataItems() const override;

    /// True for the targets GL and CPU, the values below 2.
    bool canBuildFilterExecutable(TargetPlatform target) const override;

protected:
    /// Sets the identity of the filter's type.
    virtual void setIdentifier(Identifier const& identifier);

public:
    /// An unconnected copy, made through the copy constructor. Changes nothing on this filter.
    virtual std::shared_ptr<Filter> clone() = 0;

    /// Called once on a filter of the intermediate graph: a composite replaces itself by its parts and
    /// returns what forwards its parameter values to them. The default does nothing and returns an empty
    /// pointer.
    virtual std::shared_ptr<ParameterForwarder> unFold(OptimizationOptions const& options);

protected:
    /// Creates the empty sets and the output. The constructor calls the one of this class.
    virtual void lazyInitialize();

    /// The costly part of the set-up, run once by `initialize`. Overrides end by calling this one.
    virtual void finishLazyInitialization();

public:
    /// Runs the costly part of the set-up, unless that was done. The factory does this to a prototype before
    /// it clones it, which is why it can be asked of a constant filter. If it throws, the inputs, metadata
    /// items and owned parameters that it had added are gone again, and it may be tried once more.
    void initialize() const;

    bool isInitialized() const { return initialized; }

    /// Moves on each connect and disconnect, and on adapters with a change of image; never with parameter
    /// values.
    int getTimeStamp() const { return timeStamp; }

    /// The time stamp that the original had when this filter was copied from it.
    int getClonedTimeStamp() const { return clonedTimeStamp; }

    void updateTimeStamp() { ++timeStamp; }

    /// The mark of the traversal: 0 unvisited, 1 on the current path, 2 finished.
    std::uint32_t getColor() const { return color; }

    void setColor(std::uint32_t newColor) { color = newColor; }

    void resetColor() { color = 0; }

    /// Sets the channel count that an input demands; 0 accepts any.
    /// @throws InternalException "Enforce pInput != NULL" for null.
    void updateNumChannelsOnInput(Input* pInput, std::size_t nChannel);

    /// Appends an item and takes ownership of it.
    /// @throws InternalException "Enforce pItem != NULL" for null.
    void addMetadataItem(MetadataItemBase const* pItem);

    /// Appends a clone of every item to another filter.
    /// @throws InternalException "Enforce pTarget != NULL" for null.
    void cloneMetadata(Filter* pTarget) const;

protected:
    Filter();

    /// An unconnected copy of the other filter, see `assign`.
    Filter(Filter const& other);

    /// Disconnects this filter and makes it a copy of the other, see `assign`. Owned parameters are deleted.
    /// The time stamps of its old producers move, its own stays.
    Filter& operator=(Filter const& other);

    /// Takes over identity, parameters, inputs, output and metadata as clones, and the other's time stamp as
    /// the cloned time stamp; the own time stamp stays. On an exception this filter is left as it was.
    void assign(Filter const& other);

    /// Appends an input; 0 channels accept any image.
    /// @throws InternalException "existing==0" if there is one of that name.
    void addInput(std::string const& name, std::size_t nChannel);

    /// Appends a parameter, which stays the caller's to delete.
    /// @throws InternalException "!iParameter" if there is one of that name, "Enforce pParameter != NULL" for
    /// null.
    void addParameter(ParameterBase* pParameter);

    /// Appends a parameter, which the filter owns; it dies here if it cannot be added.
    void addParameter(OwnedParameter parameter);

    /// Deletes the set of parameters; the parameters themselves are then nobody's but the caller's.
    void clearParameterSet();

    /// Deletes all parameters and the set.
    void deleteAllParameters();

private:
    using OwnedInput = std::unique_ptr<Input, ORVODeleter<Input>>;
    using OwnedOutput = std::unique_ptr<Output, ORVODeleter<Output>>;
    using OwnedMetadata = std::unique_ptr<MetadataItemBase const, ORVODeleter<MetadataItemBase const>>;
    struct Parts;

    /// How many of each the filter owns.
    struct Sizes {
        std::size_t nInputs;
        std::size_t nParameters;
        std::size_t nMetadata;
    };

    InputSet& inputSet() const;
    ParameterSet& parameterSet() const;
    void cloneParameters(Filter const& other, Parts& parts);
    void cloneConnectors(Filter const& other, Parts& parts);
    void releaseInputs() noexcept;
    void shrinkTo(Sizes const& sizes) noexcept;

    std::unique_ptr<ParameterSet> pParameterSet_;
    std::unique_ptr<InputSet> pInputSet_;
    OwnedOutput pOutput_;
    Identifier identifier_;
    std::uint32_t color = 0;
    std::vector<MetadataItemBase const*> metadata_;
    int timeStamp = 0;
    int clonedTimeStamp = 0;
    bool initialized = false;
    // Behind the views above, which list what these own.
    std::vector<OwnedParameter> ownedParameters_;
    std::vector<OwnedInput> ownedInputs_;
    std::vector<OwnedMetadata> ownedMetadata_;
};

} // namespace ORVO::FilterGraph::Internal
