#pragma once

#include <cstddef>

#include "basic/core/typedispatch/typedispatch.h"
#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

using typedispatch::IConvertTo;

namespace details
{

/// The row function of IntensitySample for the element types at the positions nIn and nOut of
/// StandardTypeList: nCount samples from nCount pairs.
void ConvertIntensityRow(std::size_t nIn, std::size_t nOut, const void* pIn, void* pOut,
                         std::size_t nCount);

}  // namespace details

/// Moves the samples of a raster into another one of the same total width and height and of another
/// type, margins included. What happens depends on the complex flags:
///
///     equal                                   ConvertTo, the parts of complex samples one by one
///     complex to twice as many real channels  the parts become channels, by ConvertTo
///     real to half as many complex channels   the channels become parts, by ConvertTo
///     else real to complex                    ConvertToComplex
///     else complex to real                    ConvertToIntensity
///
/// Meant: the last two leave the channels out of their count and so touch only as many samples as
/// the block has pixels, all of them only where there is one channel.
///
/// Types    all with whole bytes, complex ones of any part included.
/// Errors   kor::Exception "Invalid type to dispatch." for others (eDT_BIT, unsigned floats);
///          nothing is written then. Neither the pointers nor the sizes are checked; in hardened
///          builds kor::Exception for a null pointer and for an output that is too small.
/// Threads  works on the calling thread.
void ConvertRaster(const tessel::Raster* poIn, tessel::Raster* poOut);

/// Converts nCount elements by the rules of ConvertSample<TIn, TOut>.
template <class TIn, class TOut>
class ConvertTo : public typedispatch::DualDispatch<ConvertTo>::template FirstDataTypeHolder<
                      TIn>::template AssignSecondDataType<TOut>
{
public:
    void operator()(const void* pIn, void* pOut, std::size_t nCount) override
    {
        ConvertSamples(static_cast<const TIn*>(pIn), static_cast<TOut*>(pOut), nCount);
    }
};

/// Sets the real parts of nCount complex output samples to 0. Meant: the input is not read and the
/// imaginary parts stay as they were.
template <class TIn, class TOut>
class ConvertToComplex
    : public typedispatch::DualDispatch<ConvertToComplex>::template FirstDataTypeHolder<
          TIn>::template AssignSecondDataType<TOut>
{
public:
    void operator()(const void* /*pIn*/, void* pOut, std::size_t nCount) override
    {
        auto* pParts = static_cast<TOut*>(pOut);
        for (std::size_t k = 0; k < nCount; ++k)
        {
            pParts[2 * k] = TOut(0);
        }
    }
};

/// Converts nCount complex input samples to re * re + im * im by the rules of IntensitySample.
template <class TIn, class TOut>
class ConvertToIntensity
    : public typedispatch::DualDispatch<ConvertToIntensity>::template FirstDataTypeHolder<
          TIn>::template AssignSecondDataType<TOut>
{
public:
    void operator()(const void* pIn, void* pOut, std::size_t nCount) override
    {
        details::ConvertIntensityRow(typedispatch::ElementPosition<TIn>(),
                                     typedispatch::ElementPosition<TOut>(), pIn, pOut, nCount);
    }
};

}  // namespace kor::filters

namespace kor::typedispatch
{

extern template IConvertTo* DualDispatch<filters::ConvertTo>::Create(const tessel::DataType& oIn,
                                                                     const tessel::DataType& oOut);
extern template IConvertTo* DualDispatch<filters::ConvertToComplex>::Create(
    const tessel::DataType& oIn, const tessel::DataType& oOut);
extern template IConvertTo* DualDispatch<filters::ConvertToIntensity>::Create(
    const tessel::DataType& oIn, const tessel::DataType& oOut);

}  // namespace kor::typedispatch
