#pragma once

#include <string>

#include "basic/tessel/raster/raster.h"

namespace kor::datasources
{

/// Makes the files that GDAL knows known to DatasetManager. Needed once in a program, before the
/// first file is opened; more calls do nothing. May be called from any thread.
///
/// Opened are files of these formats: GTiff, COG, ENVI, EHdr, HFA, AAIGrid, SRTMHGT, JP2OpenJPEG,
/// PNG, JPEG, as far as the GDAL at hand has them; DatasetManager::AllowDriver adds one by its GDAL
/// name, except VRT, whose files refer to others and are never opened. GDAL's own settings (its
/// block cache among them) stay as the program has set them.
///
/// Made are files of the formats of these that can be written block by block: GTiff, ENVI, EHdr,
/// HFA. The file comes into being with CreateChannels, which has to be called before anything else
/// is set, and once: channels cannot be added to a file that is there. All channels of a file have
/// one type. eDT_BIT, eDT_C16U and eDT_C32U do not exist in GDAL and are refused, as is a type that
/// the format does not have. A dataset that is destroyed before CreateChannels leaves no file.
///
/// Reading   each reader has a handle of its own on a file opened for reading. On a file that is
///           being written, all readers and writers take turns at one handle.
/// Changing  files of the formats that can be made can be opened for changing, and no others.
///           Pixels of plain samples with several channels side by side (ENVI with INTERLEAVE=BIP)
///           are read and never written: GDAL 3.6 loses some on the way.
/// Samples   are never converted by GDAL. 8-bit bands marked as signed bytes are eDT_8S. A sample
///           that the option NBITS leaves too few bits for is refused (kor::IOException).
/// Tiles     of readers and writers are the file's own: tiles, or strips as wide as the image.
/// Texts     Descriptions, no-data values, metadata and georeferencing that a format has no place
///           for go to NAME.aux.xml beside a file that is made or changed, never beside one that is
///           read. What would not come back as it was set is refused with kor::DataException, and
///           the old one stays: ENVI and EHdr hold no sheared images, EHdr changes no no-data value
///           and HFA takes no description away. Refused as well are texts that begin with a blank
///           or have control characters in them, and names of metadata items with '=' or ':' or
///           that differ from another in capital letters alone.
/// No data   GTiff has one value for the whole file: a second, different one is refused, and
///           channels that were given none show it too when the file is opened again. Blocks of a
///           GTiff that were never written hold it.
/// Bitmaps   1 to n are the channels of one bit (option NBITS=1) and those of opacities, in their
///           own order, and behind them the mask of the file, if it has one: that of a GTiff,
///           inside it or in the file NAME.msk that another program has put beside it, or of a
///           JPEG. The former are those channels seen another way: a bit is set where the sample is
///           not 0, and setting it writes 1 or full opacity. A no-data value makes no bitmap.
///           CreateBitmap gives a GTiff a mask inside it, one at most, at any time after
///           CreateChannels, and throws kor::DataException for every other format. All readers and
///           writers of bitmaps take turns at the dataset's own handle. Four channels of eDT_8U are
///           four channels: the last is taken for opacities only with the option ALPHA=YES.
/// Flush     closes the file, so that every error has shown when it returns, and opens it anew when
///           it is used again.
/// Errors    what GDAL reports is in the messages; nothing is printed.
void RegisterGdalDriver();

/// Writes the inner area of an eDT_8U raster of one channel (grey) or three (red, green, blue) as a
/// PNG picture. An older picture of that name is replaced, and only by a whole one: the picture is
/// written beside it under another name first. No other file is left. Throws kor::DataException
/// when the raster is of another kind or empty, kor::FileException when the file cannot be written.
void WritePng(const std::string& oFile, const tessel::Raster& oRaster);

}  // namespace kor::datasources
