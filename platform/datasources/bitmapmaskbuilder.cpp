#include "platform/datasources/bitmapmaskbuilder.h"

#include <memory>

#include "platform/datasources/bitmapreader.h"
#include "platform/datasources/guard.h"

namespace kor::datasources
{

BitmapMaskBuilder::BitmapMaskBuilder(IBitmapDataset* poDataset, unsigned int nSegment, bool bFlag)
    : mpoDataset(poDataset), mnSegment(nSegment), mbInverted(bFlag)
{
    BitmapReader(poDataset, nSegment);  // throws when there is no such bitmap
}

tessel::Mask* BitmapMaskBuilder::BuildMask(const tessel::Raster& oRaster) const
{
    return Guarded(
        mpoDataset->GetFileName(),
        [&]
        {
            // A reader serves one thread, and making one costs no access to the file.
            BitmapReader oReader(mpoDataset, mnSegment);
            tessel::Raster oBits({oRaster.mnWidth, oRaster.mnHeight, 1, tessel::eDT_8U}, oRaster);
            oReader.ReadRaster(&oBits);
            if (mbInverted)
            {
                for (std::uint64_t i = 0; i < oBits.mnBufferSize; ++i)
                {
                    oBits.mpBuffer[i] ^= 1U;
                }
            }
            return std::make_unique<tessel::Mask>(oBits, oBits, oBits.mpBuffer, false, false)
                .release();
        });
}

}  // namespace kor::datasources
