#pragma once

#include <string>

namespace kor::datasources
{

/// Writes a description of a KORDSK file beside it, under its name with ".vrt" behind, and returns
/// that name. By it GDAL, and what is built on GDAL, reads the channels out of the same bytes,
/// without a copy, with descriptions, no-data values, metadata and georeferencing as they are now.
///
/// The two files have to stay together in one directory. Bitmaps are not in it, which GDAL cannot
/// read there. Signed bytes are marked PIXELTYPE=SIGNEDBYTE, which is how GDAL knew them before
/// 3.7; later ones show them unsigned. Control characters and bytes that are no UTF-8, which XML
/// cannot hold, become question marks. An older description is replaced, and only by a whole one.
///
/// Throws kor::DataException when the file has no channels, or one that GDAL cannot read there:
/// tiled, of eDT_BIT, eDT_C16U or eDT_C32U, or with sides or rows of 2^31 and more;
/// kor::FileException when it is no KORDSK file or the description cannot be written.
std::string WriteVrt(const std::string& oFile);

}  // namespace kor::datasources
