#pragma once

#include "basic/tessel/mask/imaskbuilder.h"
#include "platform/datasources/ibitmapdataset.h"

namespace kor::datasources
{

/// Makes masks out of a bitmap: a pixel is valid where its bit is set, or with bFlag where it is
/// not.
///
/// The mask has the geometry of the raster, margins included; its pixels are those of the bitmap at
/// the raster's offset. Outside the image a pixel is as the nearest one at the edge.
///
/// Errors   the constructor throws kor::DataException when poDataset is null, kor::IOException when
///          there is no such bitmap; BuildMask throws kor::IOException when reading fails.
/// Threads  one object may serve many threads.
class BitmapMaskBuilder : public tessel::IMaskBuilder
{
public:
    /// nSegment: number of the bitmap from 1. Borrows the dataset.
    BitmapMaskBuilder(IBitmapDataset* poDataset, unsigned int nSegment, bool bFlag);

    tessel::Mask* BuildMask(const tessel::Raster& oRaster) const override;

private:
    IBitmapDataset* mpoDataset;
    unsigned int mnSegment;
    bool mbInverted;
};

}  // namespace kor::datasources
