#pragma once

#include <memory>
#include <source_location>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"

/// What the filters share that choose their work by the sample types of two rasters: the checks
/// that come first, complex input seen as a real block, and the processor kept for one pair of
/// types.
namespace kor::filters
{

/// Throws kor::Exception "poRasterIn is invalid pointer" or "poRasterOut is invalid pointer" when
/// the raster is null, the input being looked at first. The exception carries the source path of
/// the filter and the function and line of the call.
void RequireRasters(const tessel::Raster* poRasterIn, const tessel::Raster* poRasterOut,
                    const char* pszSource,
                    const std::source_location& oWhere = std::source_location::current());

/// Throws kor::Exception "Output cannot be complex" when it is.
void RequireRealOutput(const tessel::Raster& oRasterOut, const char* pszSource,
                       const std::source_location& oWhere = std::source_location::current());

/// The block that a filter reads: the caller's raster, or where that is complex a real raster of
/// the same geometry made of it (its magnitude), which lives as long as this object.
class RealInput
{
public:
    explicit RealInput(tessel::Raster* poRaster);

    tessel::Raster* Get() const { return mpoRaster; }

private:
    std::unique_ptr<tessel::Raster> mpoInterpreted;
    tessel::Raster* mpoRaster;
};

/// The processor that a typed filter keeps for the pair of types it met last. Copies of a filter
/// share it. A call that finds the right processor writes nothing, so such calls may run at the
/// same time.
template <class Interface>
class ProcessorCache
{
protected:
    ~ProcessorCache() = default;
    ProcessorCache() = default;
    ProcessorCache(const ProcessorCache&) = default;
    ProcessorCache& operator=(const ProcessorCache&) = default;

    /// The kept processor if it was made for these types. Otherwise drops it, notes the types,
    /// makes another one by oMake(oIn, oOut), which gives the caller an Interface* of his own, and
    /// copies oParams into it. What oMake or the copy throws is passed on, and nothing is kept.
    template <class Params, class Make>
    const Interface& SelectProcessor(const tessel::DataType& oIn, const tessel::DataType& oOut,
                                     const Params& oParams, const Make& oMake) const
    {
        if (mpoProcessor == nullptr || moInputType != oIn || moOutputType != oOut)
        {
            mpoProcessor.reset();
            moInputType = oIn;
            moOutputType = oOut;
            std::shared_ptr<Interface> poProcessor(oMake(oIn, oOut));
            dynamic_cast<Params&>(*poProcessor) = oParams;
            mpoProcessor = std::move(poProcessor);
        }
        return *mpoProcessor;
    }

    /// The same, made from the template of all pairs of types. bExtendComplex: see
    /// DispatchTypePair.
    template <template <class, class> class InnerProcessor, class Params>
    const Interface& SelectProcessor(const tessel::DataType& oIn, const tessel::DataType& oOut,
                                     const Params& oParams, bool bExtendComplex = false) const
    {
        using Factory = typedispatch::Factory2Template<InnerProcessor, Interface>;
        return SelectProcessor(
            oIn, oOut, oParams,
            [bExtendComplex](const tessel::DataType& oFrom, const tessel::DataType& oTo)
            { return typedispatch::DispatchTypePair<Factory>(oFrom, oTo, bExtendComplex); });
    }

    mutable std::shared_ptr<Interface> mpoProcessor;
    mutable tessel::DataType moInputType;
    mutable tessel::DataType moOutputType;
};

}  // namespace kor::filters
