#include <cstdio>
#include <memory>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/datasources/gdal/gdaldriver.h"
#include "platform/datasources/irasterdataset.h"
#include "processes/qrdfilters/filteraverage.h"

using namespace kor;

namespace
{

constexpr const char* kFile = "gdalconsumer.tif";

void WriteThreePixels()
{
    double adfSamples[] = {1.0, 2.0, 6.0};
    const tessel::RasterInfo oInfo(3, 1, 1, tessel::eDT_64R);
    const tessel::Raster oPixels(oInfo, {0, 0, 0, 0}, reinterpret_cast<unsigned char*>(adfSamples),
                                 false);
    std::remove(kFile);
    const std::unique_ptr<datasources::IDataset> poFile(
        datasources::DatasetManager::GetInstance()->NewDataset(kFile, "GTiff", ""));
    auto& oImage = dynamic_cast<datasources::IRasterDataset&>(*poFile);
    const unsigned int nChannel = oImage.CreateChannels(oInfo);
    datasources::BasicWriter oWriter(&oImage, {nChannel});
    oWriter.WriteRaster(&oPixels);
    oWriter.Flush();
}

/// The mean of the three, read back around the middle one.
double ReadMean()
{
    datasources::BasicReader oReader(kFile, {1}, 0);
    tessel::Raster oIn({1, 1, 1, tessel::eDT_64R}, {1, 0, 1, 0});
    tessel::Raster oOut({1, 1, 1, tessel::eDT_64R}, {0, 0, 1, 0});
    oReader.ReadRaster(&oIn);
    filters::FilterAverage().Process(&oIn, nullptr, &oOut, nullptr);
    return *oOut.GetPixelAs<double>(0, 0);
}

}  // namespace

int main()
{
    datasources::RegisterGdalDriver();
    WriteThreePixels();
    const double dfMean = ReadMean();
    std::remove(kFile);
    std::printf("mean of 1, 2, 6: %g\n", dfMean);
    return dfMean == 3.0 ? 0 : 1;
}
