#pragma once

#include <cstdint>
#include <memory>

#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/raster/raster.h"
#include "platform/network/genericprocessor.h"

namespace kor::filters
{

/// A raster converted by the library's rules to another type, with its margins and offsets: a
/// functor for nodes of a network. The target is a type known in advance; a null raster stays null.
/// The number keeps apart functors of one type.
template <class T, int kNumber>
class ConvertRasterTo
{
public:
    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poIn) const;
};

/// The same with a target that is known when it is made. Throws kor::Exception for a null raster.
class ConvertRasterToType
{
public:
    explicit ConvertRasterToType(const tessel::DataType& oType) : moType(oType) {}

    std::shared_ptr<tessel::Raster> operator()(std::shared_ptr<tessel::Raster> poIn) const;

private:
    tessel::DataType moType;
};

extern template class ConvertRasterTo<double, 0>;

/// Adds an average filter to a network: a node for the filter, with a node before it that converts
/// to eDT_64R and one behind it that converts back, each only where the type differs. Values pass
/// as std::shared_ptr<Raster> and std::shared_ptr<Mask>, held exactly so.
///
/// nRaster, nMaskIn, nMaskOut: ids of the nodes that give the raster and the masks, which may be
/// null. nSizeX, nSizeY: the window in pixels, which the raster's margins must hold. bBGZero:
/// background is 0, else the input. oInputType: that of the raster. oOutputType: that of the
/// result; all zero means the input's. Returns the id of the last node.
std::uint64_t AddAverageFilter(GenericProcessor& oProcessor, std::uint64_t nRaster,
                               std::uint64_t nMaskIn, std::uint64_t nMaskOut, int nSizeX,
                               int nSizeY, bool bBGZero, tessel::DataType oInputType,
                               tessel::DataType oOutputType);

}  // namespace kor::filters
