#include "processes/qrdfilters/sarsim1.h"

#include <array>
#include <cmath>
#include <cstring>
#include <limits>

#include "basic/tessel/mask/mask.h"
#include "platform/datasources/basicwriter.h"
#include "platform/datasources/datasetmanager.h"
#include "platform/exception/exception.h"
#include "platform/system/memory.h"
#include "processes/qrdfilters/convertraster.h"
#include "processes/qrdfilters/simulation/linemaxima.h"
#include "processes/qrdfilters/simulation/terrainscan.h"

namespace kor::filters
{

using namespace simulation;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/sarsim1";

constexpr std::int64_t kMostSlots = 10000;  ///< buffer rows that are given out to lines
/// What the rows of one run take for each column of the window.
constexpr std::size_t kRowBytes = sizeof(std::int16_t) + 2 * sizeof(float) + 1;
constexpr std::int64_t kMostLines = 65536;  ///< lines that a buffer row can be looked up for

/// Cut to a 16-bit integer.
std::int16_t Short(double dfValue)
{
    return static_cast<std::int16_t>(Truncated(dfValue));
}

}  // namespace

namespace details
{

SarSim1Params::SarSim1Params(std::vector<unsigned int> vnDbec, std::vector<int> vnDbiw,
                             std::vector<double> vdfEscale, std::vector<double> vdfBackelev,
                             std::vector<double> vdfOutputxsz, std::vector<double> vdfAlti,
                             std::vector<double> vdfHead, std::vector<double> vdfMinlook,
                             std::vector<double> vdfNRPoint, std::vector<int> vnOversamp)
    : Dbec(std::move(vnDbec)),
      Dbiw(std::move(vnDbiw)),
      Escale(std::move(vdfEscale)),
      Backelev(std::move(vdfBackelev)),
      Outputxsz(std::move(vdfOutputxsz)),
      Alti(std::move(vdfAlti)),
      Head(std::move(vdfHead)),
      Minlook(std::move(vdfMinlook)),
      NRPoint(std::move(vdfNRPoint)),
      Oversamp(std::move(vnOversamp))
{
}

}  // namespace details

/// The image with its masks, and the view in which it was taken.
///
/// A line gets a row of the buffer when it is first hit: rows are in the order of first hits. The
/// masks are in the order of lines.
class SarSim1::RadarImage
{
public:
    RadarImage(const Viewpoint& oView, const RadarGrid& oGrid, double dfPixelRange,
               double dfPixelAzimuth, const DemWindow& oWindow)
        : moView(oView),
          moGrid(oGrid),
          mdfHalfPixel(dfPixelRange * 0.5),
          mbMaskLinesAreLines(oView.mdfPixelY == dfPixelAzimuth),
          mdfPerPixelY(1.0 / oView.mdfPixelY),
          mnSlots(std::min(oGrid.mnLines, kMostSlots)),
          mvnCounts(PixelCount()),
          mvnLayover((PixelCount() + 7) / 8),
          mvnShadow((PixelCount() + 7) / 8),
          mvnRowOfLine(kMostLines, 0),
          mvnLineOfRow(kMostSlots, 0),
          moMaxima(oWindow.mnWidth, oGrid.mdfNearRange)
    {
        std::fill_n(mvnRowOfLine.begin(), std::min(oGrid.mnLines, kMostLines), std::int64_t{-1});
    }

    /// What the image takes.
    static double GetBytes(const RadarGrid& oGrid)
    {
        return static_cast<double>(oGrid.mnPixels) * static_cast<double>(oGrid.mnLines) *
               (sizeof(std::uint16_t) + 2.0 / 8.0);
    }

    void Hit(std::int64_t nLine, std::int64_t nColumn)
    {
        // Meant: a line beyond the table reads 0 there, the first row of the buffer.
        std::int64_t nFirst = 0;
        if (nLine <= kMostLines)
        {
            std::int64_t& nRow = mvnRowOfLine[static_cast<std::size_t>(nLine - 1)];
            if (nRow < 0)
            {
                nRow = GiveOutRow(nLine);
            }
            nFirst = nRow;
        }
        // Meant: column 0 of a mirrored line is the last pixel of the buffer's row before.
        const auto nPlace = static_cast<std::uint64_t>(nFirst - 1 + nColumn);
        if (nPlace < mvnCounts.size())
        {
            ++mvnCounts[nPlace];
        }
    }

    void Mark(const CellCorner& oCorner)
    {
        const std::int64_t nMaskLine = mbMaskLinesAreLines
                                           ? oCorner.mnLine
                                           : Truncated(mdfPerPixelY * oCorner.mdfAlong + 1.0 + 0.5);
        const std::int64_t nBit = (oCorner.mnLine - 1) * moGrid.mnPixels - 1 + oCorner.mnColumn;
        if (moMaxima.IsInShadow(nMaskLine, oCorner.mdfLook))
        {
            SetBit(nBit, mvnShadow);
        }
        if (moMaxima.IsInLayover(nMaskLine, oCorner.mdfRange, mdfHalfPixel))
        {
            SetBit(nBit, mvnLayover);
        }
    }

    const Viewpoint& GetView() const { return moView; }
    const RadarGrid& GetGrid() const { return moGrid; }
    const std::vector<unsigned char>& GetLayover() const { return mvnLayover; }
    const std::vector<unsigned char>& GetShadow() const { return mvnShadow; }
    /// Line in row k of the buffer, 0 for none.
    std::int64_t GetLineOfRow(std::int64_t k) const
    {
        return k < kMostSlots ? mvnLineOfRow[static_cast<std::size_t>(k)] : 0;
    }
    const std::uint16_t* GetRow(std::int64_t k) const
    {
        return mvnCounts.data() + k * moGrid.mnPixels;
    }

private:
    std::size_t PixelCount() const
    {
        return static_cast<std::size_t>(moGrid.mnPixels * moGrid.mnLines);
    }

    std::int64_t GiveOutRow(std::int64_t nLine)
    {
        const std::int64_t nRow = mnNextSlot;
        mvnLineOfRow[static_cast<std::size_t>(nRow)] = nLine;
        mnNextSlot = (mnNextSlot + 1) % mnSlots;
        return nRow * moGrid.mnPixels;
    }

    static void SetBit(std::int64_t nBit, std::vector<unsigned char>& vnMask)
    {
        if (nBit >= 0 && nBit / 8 < static_cast<std::int64_t>(vnMask.size()))
        {
            vnMask[static_cast<std::size_t>(nBit / 8)] |=
                static_cast<unsigned char>(0x80U >> (nBit & 7));
        }
    }

    Viewpoint moView;
    RadarGrid moGrid;
    double mdfHalfPixel;
    bool mbMaskLinesAreLines;  ///< else the maxima are those of lines one DEM pixel high
    double mdfPerPixelY;
    std::int64_t mnSlots;
    std::int64_t mnNextSlot = 0;
    std::vector<std::uint16_t> mvnCounts;
    std::vector<unsigned char> mvnLayover;
    std::vector<unsigned char> mvnShadow;
    std::vector<std::int64_t>
        mvnRowOfLine;  ///< place of its first counter, -1 before the first hit
    std::vector<std::int64_t> mvnLineOfRow;
    LineMaxima moMaxima;
};

/// One call of Process.
class SarSim1::Run
{
public:
    Run(SarSim1& oParams, datasources::BasicReader& oReader) : moParams(oParams), moReader(oReader)
    {
        RequireParameters();
        moWindow = WindowOf(moParams.Dbiw);
        RequireWindow(moWindow, moReader, kSource);
        RequireRowMemory(moWindow, kRowBytes);
        // One sample more than the window: the test for background reads it.
        mvnRow.resize(static_cast<std::size_t>(moWindow.mnWidth) + 1);
        mvfPrevious.resize(static_cast<std::size_t>(moWindow.mnWidth));
        mvfCurrent.resize(static_cast<std::size_t>(moWindow.mnWidth));
        mvnSkipped.resize(static_cast<std::size_t>(moWindow.mnWidth));
    }

    std::shared_ptr<const RadarImage> Simulate();

private:
    void RequireParameters() const;
    void PlaceNearPoint();
    ElevationRange FindElevations();
    void SampleRow(std::int64_t nRow, float& fLowest, float& fHighest);
    RadarGrid MakeGrid(const ElevationRange& oElevations);
    void ReadRow(std::int64_t nRow);
    bool ScaleRow(bool bFirst);
    void Scan(RadarImage& oImage);

    bool IsBackground(std::int16_t nSample) const
    {
        return static_cast<double>(nSample) == moParams.Backelev[0];
    }

    SarSim1& moParams;
    datasources::BasicReader& moReader;
    DemWindow moWindow;
    Viewpoint moView;
    ScanFrame moFrame{0.0, 0.0, 0.0, 0.0};
    RadarGrid moGrid;
    std::vector<std::int16_t> mvnRow;
    std::size_t mnRowSamples = 0;  ///< those of mvnRow that the DEM has
    std::vector<float> mvfPrevious;
    std::vector<float> mvfCurrent;
    std::vector<unsigned char> mvnSkipped;
};

void SarSim1::Run::RequireParameters() const
{
    RequireValues(moParams.Dbiw, 4, "Dbiw", kSource);
    RequireValues(moParams.Escale, 2, "Escale", kSource);
    RequireValues(moParams.Backelev, 1, "Backelev", kSource);
    RequireValues(moParams.Outputxsz, 2, "Outputxsz", kSource);
    RequireValues(moParams.Alti, 1, "Alti", kSource);
    RequireValues(moParams.Head, 1, "Head", kSource);
    RequireValues(moParams.Minlook, 1, "Minlook", kSource);
    RequireValues(moParams.Oversamp, 1, "Oversamp", kSource);
    if (!moParams.NRPoint.empty())
    {
        RequireValues(moParams.NRPoint, 2, "NRPoint", kSource);
    }
}

/// The near range point, and the DEM's pixels, in the map.
void SarSim1::Run::PlaceNearPoint()
{
    const ogc::cs::GeocodingInfo& oMap = moReader.GetGeocodingInfo();
    const double dfLeft = static_cast<double>(moWindow.mnX) * oMap.GetXPerCol() + oMap.GetXOffset();
    const double dfTop = static_cast<double>(moWindow.mnY) * oMap.GetYPerRow() + oMap.GetYOffset();
    moView.mdfPixelX = std::fabs(oMap.GetXPerCol());
    moView.mdfPixelY = std::fabs(oMap.GetYPerRow());
    std::vector<double>& vdfPoint = moParams.NRPoint;
    if (vdfPoint.empty())
    {
        vdfPoint = {RoundedToSingle(dfLeft), RoundedToSingle(dfTop)};
    }
    moView.mnNearCol =
        Truncated((vdfPoint[0] - oMap.GetXOffset()) / moView.mdfPixelX + 0.5) - moWindow.mnX;
    moView.mnNearRow =
        Truncated((oMap.GetYOffset() - vdfPoint[1]) / moView.mdfPixelY + 0.5) - moWindow.mnY;
    moView.mfWindowLeftX = static_cast<float>(dfLeft);
}

/// Elevations of the DEM, from some of its rows. An offset of 0 becomes the lowest sample.
ElevationRange SarSim1::Run::FindElevations()
{
    std::vector<double>& vdfScale = moParams.Escale;
    const bool bBytes = ChannelBits(moReader, kSource) == 8;
    float fLowest = 1e38F;
    float fHighest = -1e38F;
    if (!bBytes)
    {
        const auto nRoot =
            static_cast<std::int64_t>(std::sqrt(static_cast<float>(moWindow.mnHeight)));
        for (std::int64_t y = 0; y < moWindow.mnHeight; y += std::max<std::int64_t>(nRoot, 1))
        {
            SampleRow(moWindow.mnY + y, fLowest, fHighest);
        }
        if (fLowest > fHighest)
        {
            throw Exception("No elevation was found: all samples are background, " +
                                std::to_string(moParams.Backelev[0]),
                            kSource, __PRETTY_FUNCTION__, __LINE__);
        }
        if (vdfScale[1] == 0.0)
        {
            vdfScale[1] = static_cast<double>(fLowest);
        }
    }
    const double dfLowest = RoundedToSingle(vdfScale[0] * vdfScale[1]);
    const double dfSpan =
        bBytes ? vdfScale[0] * 255.0 : static_cast<double>(fHighest) * vdfScale[0];
    return {dfLowest, RoundedToSingle(dfSpan + dfLowest)};
}

void SarSim1::Run::SampleRow(std::int64_t nRow, float& fLowest, float& fHighest)
{
    ReadRow(nRow);
    for (std::size_t i = 0; i < mvfCurrent.size(); ++i)
    {
        const float fSample = mvnRow[i];
        if (!IsBackground(mvnRow[i]))
        {
            fHighest = fSample > fHighest ? fSample : fHighest;
            fLowest = fSample < fLowest ? fSample : fLowest;
        }
    }
}

RadarGrid SarSim1::Run::MakeGrid(const ElevationRange& oElevations)
{
    const double dfPixelRange = moParams.Outputxsz[0];
    const double dfPixelAzimuth = moParams.Outputxsz[1];
    const auto fAltitude = static_cast<float>(moParams.Alti[0]);
    const auto fHeading = static_cast<float>(moParams.Head[0]);
    const Projection<Division::eQuotient> oProjection(moView, fAltitude, fHeading);
    const double dfNearY = static_cast<double>(moView.mnNearRow) * moView.mdfPixelY;
    const auto oGroundRange = [&](const ScanFrame::Corner& oCorner, double dfElevation)
    { return oProjection.RangesOf(oCorner.x, dfNearY - oCorner.y, dfElevation).mdfGround; };

    RadarGrid oGrid;
    oGrid.mdfNearRange = oGroundRange(moFrame.moNear, oElevations.mdfHighest);
    const double dfFarRange = oGroundRange(moFrame.moFar, oElevations.mdfLowest);
    oGrid.mdfPerRange = 1.0 / dfPixelRange;
    oGrid.mdfPerAzimuth = 1.0 / dfPixelAzimuth;
    oGrid.mdfStart = moFrame.mdfStart;
    oGrid.mbMirror = moFrame.mbMirror;
    oGrid.mnLines =
        ImageSize(std::trunc((moFrame.mdfEnd - moFrame.mdfStart) / dfPixelAzimuth + 0.5) + 1.0,
                  "lines", kSource);
    oGrid.mnPixels =
        ImageSize(std::trunc((dfFarRange - oGrid.mdfNearRange) / dfPixelRange + 0.5) + 1.0,
                  "pixels a line", kSource);
    return oGrid;
}

/// Brings the samples of a row, counted from 0, into mvnRow; 0 where the row has none.
void SarSim1::Run::ReadRow(std::int64_t nRow)
{
    std::unique_ptr<tessel::Raster> poRow(moReader.GetRaster(static_cast<unsigned int>(nRow)));
    if (poRow->moDataType != tessel::eDT_16S)
    {
        tessel::RasterInfo oInfo = *poRow;
        oInfo.moDataType = tessel::eDT_16S;
        auto poShorts = std::make_unique<tessel::Raster>(oInfo, *poRow);
        ConvertRaster(poRow.get(), poShorts.get());
        poRow = std::move(poShorts);
    }
    const unsigned char* pFirst = poRow->GetPixel(0, 0);
    const auto nBytes = static_cast<std::size_t>(poRow->mpBuffer + poRow->mnBufferSize - pFirst);
    mnRowSamples = std::min(nBytes / sizeof(std::int16_t), mvnRow.size());
    std::memcpy(mvnRow.data(), pFirst, mnRowSamples * sizeof(std::int16_t));
    std::fill(mvnRow.begin() + static_cast<std::ptrdiff_t>(mnRowSamples), mvnRow.end(),
              std::int16_t{0});
}

/// Turns the samples of mvnRow into elevations. On the first row also those of the row before; then
/// true when the last sample is one.
bool SarSim1::Run::ScaleRow(bool bFirst)
{
    const std::int16_t nOffset = Short(moParams.Escale[1]);
    const std::int16_t nScale = Short(moParams.Escale[0]);
    bool bLastScaled = false;
    for (std::size_t i = 0; i < mvfCurrent.size(); ++i)
    {
        bLastScaled = !IsBackground(mvnRow[i]);
        if (bLastScaled)
        {
            // Meant: both operations wrap at 16 bits.
            const auto nSum = static_cast<std::int16_t>(nOffset + mvnRow[i]);
            const auto nElevation = static_cast<std::int16_t>(nSum * nScale);
            if (bFirst)
            {
                mvfPrevious[i] = nElevation;
            }
            // What lies behind the row's end cannot be written.
            mvnRow[i] = i < mnRowSamples ? nElevation : std::int16_t{0};
        }
        mvfCurrent[i] = mvnRow[i];
    }
    return bFirst && bLastScaled;
}

void SarSim1::Run::Scan(RadarImage& oImage)
{
    const ScanOrder oOrder(moParams.Head[0], moWindow);
    const Projection<Division::eQuotient> oProjection(moView, static_cast<float>(moParams.Alti[0]),
                                                      static_cast<float>(moParams.Head[0]));
    TerrainScan<Division::eQuotient> oScan(oProjection, moWindow, oOrder, moFrame, moGrid,
                                           moParams.Oversamp[0]);
    const std::int64_t nBehindLast = oOrder.mnLastRow + oOrder.mnRowStep;
    for (std::int64_t nRow = oOrder.mnFirstRow; nRow != nBehindLast; nRow += oOrder.mnRowStep)
    {
        const bool bFirst = nRow == oOrder.mnFirstRow;
        if (!bFirst)
        {
            mvfPrevious.swap(mvfCurrent);
        }
        ReadRow(nRow - 1);
        if (ScaleRow(bFirst))
        {
            continue;
        }
        // Meant: the sample to the right of a cell's first column, whichever way the scan runs.
        for (std::size_t i = 0; i < mvnSkipped.size(); ++i)
        {
            mvnSkipped[i] = IsBackground(mvnRow[i + 1]) ? 1 : 0;
        }
        oScan.ScanRow(nRow, mvfPrevious, mvfCurrent, mvnSkipped, oImage);
    }
}

std::shared_ptr<const SarSim1::RadarImage> SarSim1::Run::Simulate()
{
    moReader.SetTileSize(moReader.GetWidth(), 1);
    PlaceNearPoint();
    const double dfHeading = moParams.Head[0];
    moFrame = ScanFrame(dfHeading, kPi * dfHeading / 180.0,
                        static_cast<double>(moWindow.mnWidth - 1) * moView.mdfPixelX,
                        static_cast<double>(moWindow.mnHeight - 1) * moView.mdfPixelY);
    moView.mfSideSign = moFrame.mfSideSign;
    SetOrbit(moParams.Alti[0], kPi * moParams.Minlook[0] / 180.0, moView);
    moGrid = MakeGrid(FindElevations());
    RequireMemory(RadarImage::GetBytes(moGrid) + LineMaxima::GetBytes(moWindow.mnWidth) +
                      TerrainScan<Division::eQuotient>::GetBytes(moWindow, moParams.Oversamp[0]),
                  "A radar image of " + std::to_string(moGrid.mnPixels) + " x " +
                      std::to_string(moGrid.mnLines) + " pixels");
    const auto poImage = std::make_shared<RadarImage>(moView, moGrid, moParams.Outputxsz[0],
                                                      moParams.Outputxsz[1], moWindow);
    Scan(*poImage);
    return poImage;
}

SarSim1::SarSim1(std::vector<unsigned int> vnDbec, std::vector<int> vnDbiw,
                 std::vector<double> vdfEscale, std::vector<double> vdfBackelev,
                 std::vector<double> vdfOutputxsz, std::vector<double> vdfAlti,
                 std::vector<double> vdfHead, std::vector<double> vdfMinlook,
                 std::vector<double> vdfNRPoint, std::vector<int> vnOversamp)
    : SarSim1Params(std::move(vnDbec), std::move(vnDbiw), std::move(vdfEscale),
                    std::move(vdfBackelev), std::move(vdfOutputxsz), std::move(vdfAlti),
                    std::move(vdfHead), std::move(vdfMinlook), std::move(vdfNRPoint),
                    std::move(vnOversamp))
{
}

void SarSim1::Process(datasources::BasicReader& oReader)
{
    mpoImage = Run(*this, oReader).Simulate();
}

int SarSim1::GetSarlin() const
{
    return mpoImage ? static_cast<int>(mpoImage->GetGrid().mnLines) : 0;
}

int SarSim1::GetSarpix() const
{
    return mpoImage ? static_cast<int>(mpoImage->GetGrid().mnPixels) : 0;
}

void SarSim1::range(float fAlti, float fHead, double dfElev, double dfX, double dfY,
                    double* pdfLook, double* pdfRange) const
{
    const Projection<Division::eQuotient> oProjection(mpoImage ? mpoImage->GetView() : Viewpoint(),
                                                      fAlti, fHead);
    const Ranges oRanges = oProjection.RangesOf(dfX, dfY, dfElev);
    *pdfRange = oRanges.mdfGround;
    *pdfLook = oProjection.LookAngle(oRanges.mdfSlant, dfElev);
}

namespace
{

void WriteMask(const std::vector<unsigned char>& vnBits, std::uint32_t nWidth,
               std::uint32_t nHeight, datasources::BasicWriter& oWriter)
{
    // The mask takes its bits from a buffer that it may change; it is told to copy them.
    std::vector<unsigned char> vnCopy = vnBits;
    const tessel::Mask oMask({nWidth, nHeight, 1, tessel::eDT_BIT}, {}, vnCopy.data(), false, true);
    const std::unique_ptr<tessel::Raster> poRaster(oMask.CreateRaster());
    oWriter.WriteRaster(poRaster.get());
}

void Describe(const char* pszText, datasources::BasicWriter& oWriter)
{
    datasources::AuxiliaryData oData = oWriter.GetAuxiliaryData();
    oData.SetChannelDescription(pszText, 1);
    oWriter.SetAuxiliaryData(oData);
}

}  // namespace

void SarSim1::RequireImage() const
{
    if (mpoImage == nullptr)
    {
        throw Exception("There is no image yet: Process has not run", kSource, __PRETTY_FUNCTION__,
                        __LINE__);
    }
}

void SarSim1::Output(std::string oFile) const
{
    RequireImage();  // before a file is made
    const std::unique_ptr<datasources::IDataset> poDataset(
        datasources::DatasetManager::GetInstance()->NewDataset(oFile, "KORDSK", ""));
    Output(poDataset.get());
    poDataset->Flush();
}

void SarSim1::Output(datasources::IDataset* poDataset) const
{
    auto* poRasters = dynamic_cast<datasources::IRasterDataset*>(poDataset);
    auto* poBitmaps = dynamic_cast<datasources::IBitmapDataset*>(poDataset);
    RequireImage();
    if (poRasters == nullptr || poBitmaps == nullptr)
    {
        throw Exception(poDataset == nullptr
                            ? "poDataset is invalid pointer"
                            : "The dataset cannot hold the image: it needs channels and bitmaps",
                        kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    const auto nWidth = static_cast<std::uint32_t>(GetSarpix());
    const auto nHeight = static_cast<std::uint32_t>(GetSarlin());
    poRasters->CreateChannels({nWidth, nHeight, 1, tessel::eDT_16U});
    const unsigned int nLayover = poBitmaps->CreateBitmap(nWidth, nHeight);
    const unsigned int nShadow = poBitmaps->CreateBitmap(nWidth, nHeight);
    datasources::BasicWriter oImageWriter(poRasters, {1});
    datasources::BasicWriter oShadowWriter(poBitmaps, nShadow);
    datasources::BasicWriter oLayoverWriter(poBitmaps, nLayover);
    WriteMask(mpoImage->GetShadow(), nWidth, nHeight, oShadowWriter);
    WriteMask(mpoImage->GetLayover(), nWidth, nHeight, oLayoverWriter);
    std::vector<std::uint16_t> vnLine(nWidth);
    for (std::int64_t k = 0; k < std::int64_t{nHeight}; ++k)
    {
        // A row without a line goes behind the image, where the writer drops it.
        const std::int64_t nLine = mpoImage->GetLineOfRow(k);
        const auto nY = static_cast<std::uint32_t>(Flip ? nHeight - nLine : nLine - 1);
        std::copy_n(mpoImage->GetRow(k), nWidth, vnLine.begin());
        const tessel::Raster oLine({nWidth, 1, 1, tessel::eDT_16U}, {0, 0, 0, nY},
                                   reinterpret_cast<unsigned char*>(vnLine.data()), false);
        oImageWriter.WriteRaster(&oLine);
    }
    Describe("Simulated SAR image: range/azimuth projection", oImageWriter);
    Describe("Shadow Mask: range/azimuth projection", oShadowWriter);
    Describe("Layover Mask: range/azimuth projection", oLayoverWriter);
}

}  // namespace kor::filters
