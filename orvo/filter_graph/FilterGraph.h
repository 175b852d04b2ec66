#pragma once

/// The public filter graph: what a host builds its graphs of filters with, and computes frames from them.
///
/// In short: start the layers (`Library`), create filters (`FilterFactory`), set their parameters
/// (`Parameter`), make one adapter for each image that goes in and one for the image that comes out
/// (`createInputAdapter`, `createOutputAdapter`), bind the images (`ImageCPU`, `ImageGL`), connect all of
/// them
/// (`Connect`), create a processor on the output adapter (`createProcessor`), and ask it for frames.

#include "orvo/filter_graph/filters/Bilateral.h"
#include "orvo/filter_graph/filters/ColorspaceTransformer.h"
#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/CreateProcessor.h"
#include "orvo/filter_graph/impl/DataDescriptor.h"
#include "orvo/filter_graph/impl/DataItemBase.h"
#include "orvo/filter_graph/impl/DataItemType.h"
#include "orvo/filter_graph/impl/ErrorOrWarningInfo.h"
#include "orvo/filter_graph/impl/Exception.h"
#include "orvo/filter_graph/impl/FilterEquality.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/impl/IAdapter.h"
#include "orvo/filter_graph/impl/IEmbeddedProcessor.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/impl/IInputAdapter.h"
#include "orvo/filter_graph/impl/IODataDescriptors.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/impl/IProcessor.h"
#include "orvo/filter_graph/impl/IProcessorBase.h"
#include "orvo/filter_graph/impl/Identifier.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/ImageGL.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/MetadataItemBase.h"
#include "orvo/filter_graph/impl/OptimizationOptions.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/impl/ParameterBase.h"
#include "orvo/filter_graph/impl/RangeIterator.h"
#include "orvo/filter_graph/utility/ImageWrapper.h"
#include "orvo/filter_graph/utility/Tiles.h"
