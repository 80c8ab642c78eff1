#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "platform/datasources/kordsk/kordskplane.h"
#include "platform/geocoding/geocodinginfo.h"

namespace kor::datasources
{

/// Of channels, and as many of bitmaps.
inline constexpr std::size_t kMostPlanes = 65535;
/// A longer directory is neither written nor read: its memory is taken on the word of the file.
inline constexpr std::uint64_t kLargestDirectory = std::uint64_t{1} << 28;

/// All that a KORDSK file holds beside its pixels. Shared between threads, and never changed then.
struct KordskDirectory
{
    std::uint32_t mnWidth = 0;  ///< pixels; 0 as long as there are no planes
    std::uint32_t mnHeight = 0;
    bool mbTiled = false;  ///< planes to come are tiled
    /// Never null. Of its own, so that it can be held on to when the directory is replaced.
    std::shared_ptr<const ogc::cs::GeocodingInfo> mpoGeocoding =
        std::make_shared<ogc::cs::GeocodingInfo>();
    AuxiliaryData::Metadata moMetadata;
    std::vector<KordskPlane> mvoChannels;
    std::vector<KordskPlane> mvoBitmaps;
};

/// Lines of UTF-8, key=value, with texts escaped:
///
///     width=640                            pixels
///     height=480
///     layout=band                          of planes to come; or tile
///     transform=500000 10 0 4600000 0 -10  as GeocodingInfo::Transform
///     projection=PROJCS[...]               left out where empty
///     metadata.SENSOR=X                    any number of them
///     channel=1                            begins a plane; so does bitmap=1
///     type=16 0 0 16 0 0                   the fields of DataType
///     offset=4096                          of the file
///     length=614400                        bytes
///     layout=band                          or tile 256 256
///     description=amplitude                left out where empty
///     nodata=0                             left out where there is none
///     metadata.UNIT=dB
std::string PrintDirectory(const KordskDirectory& oDirectory);

/// The reverse. Throws kor::FileException with the line's number and what is wrong with it. Nothing
/// is said yet of planes and the file: see RequireSoundPlanes.
KordskDirectory ParseDirectory(const std::string& oFile, std::string_view oText);

/// Throws kor::FileException when a plane has another length than its size makes, lies outside the
/// file of nFileBytes or on no block's boundary, or meets the slots, the directory itself or
/// another plane.
void RequireSoundPlanes(const std::string& oFile, const KordskDirectory& oDirectory,
                        const FileExtent& oOwnPlace, std::uint64_t nFileBytes);

}  // namespace kor::datasources
