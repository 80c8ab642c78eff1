// Makes the pictures and tables of the pages in docs/ from the library itself; docs/make puts all
// in its place. Tables go to standard output as Markdown.

#include <filesystem>
#include <functional>
#include <iostream>
#include <map>
#include <string>
#include <vector>

#include "docs/gallery/pages.h"
#include "platform/datasources/gdal/gdaldriver.h"

namespace
{

constexpr const char* kUsage =
    "gallery radar FILE CHANNEL FOLDER    speckle on a crop of a file: pictures to FOLDER, tables\n"
    "                                     of how the radar filters do on it and on a made scene\n"
    "gallery measure FILE CHANNEL LOOKS   the radar table for an image as it is, of intensities\n"
    "gallery spatial FILE CHANNEL FOLDER  pictures of the spatial filters on a crop of a file\n"
    "gallery transforms FILE FOLDER       principal components of a file of six bands and classes\n"
    "                                     made of them: pictures to FOLDER, the analysis\n"
    "gallery simulation FILE FOLDER       a DEM as a radar sees it: pictures to FOLDER, a table\n"
    "                                     of layover and shadow\n";

using Words = std::vector<std::string>;

unsigned int ChannelOf(const std::string& oWord)
{
    return static_cast<unsigned int>(std::stoul(oWord));
}

std::filesystem::path Folder(const std::string& oPath)
{
    std::filesystem::create_directories(oPath);
    return oPath;
}

struct Job
{
    std::size_t mnWords;
    std::function<void(const Words&)> mfnRun;
};

const std::map<std::string, Job>& Jobs()
{
    using namespace kor::gallery;
    static const std::map<std::string, Job> oJobs = {
        {"radar", {3, [](const Words& o) { MakeRadarPage(o[0], ChannelOf(o[1]), Folder(o[2])); }}},
        {"spatial",
         {3, [](const Words& o) { MakeSpatialPage(o[0], ChannelOf(o[1]), Folder(o[2])); }}},
        {"measure",
         {3, [](const Words& o) { MeasureRadarImage(o[0], ChannelOf(o[1]), std::stoi(o[2])); }}},
        {"transforms", {2, [](const Words& o) { MakeTransformsPage(o[0], Folder(o[1])); }}},
        {"simulation", {2, [](const Words& o) { MakeSimulationPage(o[0], Folder(o[1])); }}},
    };
    return oJobs;
}

}  // namespace

int main(int nArguments, char* apszArguments[])
{
    try
    {
        const Words oWords(apszArguments + 1, apszArguments + nArguments);
        const auto oJob = oWords.empty() ? Jobs().end() : Jobs().find(oWords[0]);
        if (oJob == Jobs().end() || oWords.size() != 1 + oJob->second.mnWords)
        {
            std::cerr << kUsage;
            return 2;
        }
        kor::datasources::RegisterGdalDriver();
        oJob->second.mfnRun({oWords.begin() + 1, oWords.end()});
        return 0;
    }
    catch (const std::exception& oError)
    {
        std::cerr << "gallery: " << oError.what() << '\n';
        return 1;
    }
}
