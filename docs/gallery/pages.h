#pragma once

#include <filesystem>
#include <string>

namespace kor::gallery
{

/// Speckle on a crop of a channel: pictures of the radar filters to oFolder; tables of how they do
/// on it and on a made scene.
void MakeRadarPage(const std::string& oFile, unsigned int nChannel,
                   const std::filesystem::path& oFolder);
/// The table of the radar filters for a channel of intensities as it is, of so many looks.
void MeasureRadarImage(const std::string& oFile, unsigned int nChannel, int nLooks);

/// Pictures of the spatial filters on a crop of a channel, to oFolder.
void MakeSpatialPage(const std::string& oFile, unsigned int nChannel,
                     const std::filesystem::path& oFolder);
/// Principal components of a file of six bands and classes made of them: pictures to oFolder; the
/// report of the analysis.
void MakeTransformsPage(const std::string& oFile, const std::filesystem::path& oFolder);

/// A DEM as a radar sees it, from four headings and under two look angles: pictures to oFolder, a
/// table of what lies in layover and shadow.
void MakeSimulationPage(const std::string& oFile, const std::filesystem::path& oFolder);

}  // namespace kor::gallery
