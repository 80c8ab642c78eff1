#include "processes/qrdfilters/addaveragefilter.h"

#include <sstream>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/filteraverage.h"

namespace kor::filters
{

using tessel::Mask;
using tessel::Raster;

namespace
{

using RasterPointer = std::shared_ptr<Raster>;
using MaskPointer = std::shared_ptr<Mask>;

RasterPointer Converted(const Raster& oIn, const tessel::DataType& oType)
{
    auto poOut = std::make_shared<Raster>(
        tessel::RasterInfo(oIn.mnWidth, oIn.mnHeight, oIn.mnChannels, oType), oIn);
    ConvertRaster(&oIn, poOut.get());
    return poOut;
}

}  // namespace

template <class T, int kNumber>
std::shared_ptr<Raster> ConvertRasterTo<T, kNumber>::operator()(std::shared_ptr<Raster> poIn) const
{
    return poIn ? Converted(*poIn, typedispatch::RealDataType<T>()) : nullptr;
}

template class ConvertRasterTo<double, 0>;

std::shared_ptr<Raster> ConvertRasterToType::operator()(std::shared_ptr<Raster> poIn) const
{
    if (poIn == nullptr)
    {
        throw Exception("poIn is invalid pointer", "processes/qrdfilters/addaveragefilter",
                        __PRETTY_FUNCTION__, __LINE__);
    }
    return Converted(*poIn, moType);
}

std::uint64_t AddAverageFilter(GenericProcessor& oProcessor, std::uint64_t nRaster,
                               std::uint64_t nMaskIn, std::uint64_t nMaskOut, int nSizeX,
                               int nSizeY, bool bBGZero, tessel::DataType oInputType,
                               tessel::DataType oOutputType)
{
    using ToDouble =
        GenericProcessor::Function<ConvertRasterTo<double, 0>, RasterPointer, RasterPointer>;
    using FromDouble =
        GenericProcessor::Function<ConvertRasterToType, RasterPointer, RasterPointer>;
    using Average = GenericProcessor::Function<FilterAverage, RasterPointer, RasterPointer,
                                               MaskPointer, MaskPointer>;
    if (oOutputType == tessel::DataType())
    {
        oOutputType = oInputType;
    }
    std::uint64_t nCurrent = nRaster;
    if (oInputType != tessel::eDT_64R)
    {
        nCurrent = oProcessor.Add(ToDouble({}), {nCurrent}, "Convert to double");
    }
    FilterAverage oFilter(bBGZero);
    oFilter.SetFilterSize(nSizeX, nSizeY);
    std::stringstream oDescription;
    oDescription << "Average filter [" << nSizeX << ", " << nSizeY << "]";
    nCurrent = oProcessor.Add(Average(oFilter), {nCurrent, nMaskIn, nMaskOut}, oDescription.str());
    if (oOutputType != tessel::eDT_64R)
    {
        nCurrent = oProcessor.Add(FromDouble(ConvertRasterToType(oOutputType)), {nCurrent},
                                  "Convert from double");
    }
    return nCurrent;
}

}  // namespace kor::filters
