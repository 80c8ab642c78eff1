#include "platform/datasources/bitmapreader.h"

#include "platform/datasources/bitmapchannel.h"

namespace kor::datasources
{

BitmapReader::BitmapReader(IBitmapDataset* poDataset, unsigned int nBitmap)
    : BasicReader(std::make_unique<BitmapChannel>(poDataset, nBitmap), nullptr, {1})
{
}

}  // namespace kor::datasources
