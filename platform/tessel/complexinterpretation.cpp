#include "platform/tessel/complexinterpretation.h"

#include <cmath>
#include <memory>
#include <string>

#include "basic/core/typedispatch/typelist.h"
#include "platform/exception/exception.h"

namespace kor::tessel
{

namespace
{

constexpr const char* kSource = "platform/tessel/complexinterpretation";

using Quantity = double (*)(double dfRe, double dfIm);

double Magnitude(double dfRe, double dfIm)
{
    return std::hypot(dfRe, dfIm);
}

double Intensity(double dfRe, double dfIm)
{
    return dfRe * dfRe + dfIm * dfIm;
}

double Phase(double dfRe, double dfIm)
{
    return std::atan2(dfIm, dfRe);
}

double RealPart(double dfRe, double /*dfIm*/)
{
    return dfRe;
}

double ImaginaryPart(double /*dfRe*/, double dfIm)
{
    return dfIm;
}

double IntensityDb(double dfRe, double dfIm)
{
    return 10.0 * std::log10(Intensity(dfRe, dfIm));
}

constexpr Quantity kQuantities[] = {Magnitude, Intensity,     Phase,
                                    RealPart,  ImaginaryPart, IntensityDb};

template <class TPart, class TOut>
void InterpretSamples(const Raster& oIn, Quantity pfnQuantity, Raster& oOut)
{
    using Arithmetic = std::conditional_t<std::is_same_v<TPart, char>, signed char, TPart>;
    const auto* pIn = reinterpret_cast<const Arithmetic*>(oIn.mpBuffer);
    auto* pOut = reinterpret_cast<TOut*>(oOut.mpBuffer);
    const std::size_t nSamples = std::size_t{oIn.mnTotalWidth} * oIn.mnTotalHeight * oIn.mnChannels;
    for (std::size_t i = 0; i < nSamples; ++i)
    {
        pOut[i] = static_cast<TOut>(
            pfnQuantity(static_cast<double>(pIn[2 * i]), static_cast<double>(pIn[2 * i + 1])));
    }
}

[[noreturn]] void ThrowData(const std::string& oMessage, unsigned int nLine)
{
    throw DataException(oMessage, kSource,
                        "Raster* ComplexInterpretation::InterpretRaster(const Raster*, "
                        "KORInterpretationTypes) const",
                        nLine);
}

}  // namespace

Raster* ComplexInterpretation::InterpretRaster(const Raster* poRaster,
                                               KORInterpretationTypes eType) const
{
    if (poRaster == nullptr)
    {
        ThrowData("poRaster is NULL, there is nothing to interpret", __LINE__);
    }
    if (eType < eKIT_Magnitude || eType > eKIT_IntensityDb)
    {
        ThrowData("There is no complex interpretation " + std::to_string(eType), __LINE__);
    }
    if (!poRaster->moDataType.mbComplex)
    {
        ThrowData("The raster to interpret is not complex", __LINE__);
    }
    using List = typedispatch::StandardTypeList;
    std::unique_ptr<Raster> poOut;
    const auto oInterpret = [&]<class TPart>()
    {
        // float holds 16-bit parts and their magnitude; wider integers need double.
        using TOut =
            std::conditional_t<(sizeof(TPart) < 4 || std::is_same_v<TPart, float>), float, double>;
        const RasterInfo oInfo(poRaster->mnWidth, poRaster->mnHeight, poRaster->mnChannels,
                               typedispatch::RealDataType<TOut>());
        poOut = std::make_unique<Raster>(oInfo, *poRaster);
        InterpretSamples<TPart, TOut>(*poRaster, kQuantities[eType], *poOut);
    };
    typedispatch::VisitType<List>(
        typedispatch::FindDataType<List>(RealPartType(poRaster->moDataType), false), oInterpret,
        [] { ThrowData("The parts of the complex raster have no known data type", __LINE__); });
    return poOut.release();
}

}  // namespace kor::tessel
