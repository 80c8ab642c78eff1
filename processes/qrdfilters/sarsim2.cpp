#include "processes/qrdfilters/sarsim2.h"

#include <cmath>
#include <cstring>
#include <span>
#include <string>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "platform/system/memory.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/simulation/linemaxima.h"
#include "processes/qrdfilters/simulation/terrainscan.h"

namespace kor::filters
{

using namespace simulation;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/sarsim2";
constexpr std::size_t kFloat = typedispatch::ElementPosition<float>();
constexpr std::size_t kDouble = typedispatch::ElementPosition<double>();
constexpr auto kDivision = Division::eReciprocal;
/// What the rows of one run take for each column of the window: samples, elevations, results.
constexpr std::size_t kRowBytes = 3 * sizeof(double) + 2 * sizeof(float) + 2;

/// Where the samples go that one run makes.
struct Writers
{
    datasources::IRasterWriter& moImage;
    datasources::IRasterWriter& moLayover;
    datasources::IRasterWriter& moShadow;
};

/// Stores doubles as samples of one type.
using Store = void (*)(std::span<const double> oResults, unsigned char* pSamples);

/// Floating point is narrowed, integers are cut to their width without rounding; what is not a
/// number gives 0 there, and so does infinity. Numbers are less than 2^16 * 255.
template <class TOut>
void StoreCut(std::span<const double> oResults, unsigned char* pSamples)
{
    auto* pOut = reinterpret_cast<TOut*>(pSamples);
    for (std::size_t i = 0; i < oResults.size(); ++i)
    {
        if constexpr (std::is_floating_point_v<TOut>)
        {
            pOut[i] = static_cast<TOut>(oResults[i]);
        }
        else
        {
            const bool bNumber = std::isfinite(oResults[i]);
            pOut[i] = static_cast<TOut>(bNumber ? static_cast<std::int64_t>(oResults[i]) : 0);
        }
    }
}

/// The radar image of pass one: counters and masks in the order of lines. What is read outside them
/// is 0, what is written there is dropped.
class HitCounts
{
public:
    HitCounts(const RadarGrid& oGrid, double dfPixelX, const DemWindow& oWindow)
        : moGrid(oGrid),
          mdfHalfPixel(dfPixelX * 0.5),
          mvnCounts(2 * PixelCount()),
          mvnLayover(PixelCount() + 1),
          mvnShadow(PixelCount() + 1),
          moMaxima(oWindow.mnWidth, oGrid.mdfNearRange)
    {
    }

    static double GetBytes(const RadarGrid& oGrid)
    {
        return (2.0 * sizeof(std::uint16_t) + 2.0) * static_cast<double>(oGrid.mnPixels) *
               static_cast<double>(oGrid.mnLines);
    }

    void Hit(std::int64_t nLine, std::int64_t nColumn)
    {
        const auto nPlace = static_cast<std::uint64_t>(PlaceOf(nLine, nColumn));
        if (nPlace < mvnCounts.size())
        {
            const int nCount = ++mvnCounts[nPlace];
            if (nCount > mnMaxCount)
            {
                // Meant: turns negative from 32768 on, so that any count replaces it.
                mnMaxCount = static_cast<std::int16_t>(nCount);
            }
        }
    }

    void Mark(const CellCorner& oCorner)
    {
        const std::int64_t nPlace = PlaceOf(oCorner.mnLine, oCorner.mnColumn);
        if (moMaxima.IsInShadow(oCorner.mnLine, oCorner.mdfLook))
        {
            SetMark(nPlace, mvnShadow);
        }
        if (moMaxima.IsInLayover(oCorner.mnLine, oCorner.mdfRange, mdfHalfPixel))
        {
            SetMark(nPlace, mvnLayover);
        }
    }

    const RadarGrid& GetGrid() const { return moGrid; }
    std::int64_t PlaceOf(std::int64_t nLine, std::int64_t nColumn) const
    {
        return (nLine - 1) * moGrid.mnPixels - 1 + nColumn;
    }
    float GetInvMax() const { return 1.0F / static_cast<float>(mnMaxCount); }
    std::uint16_t GetCount(std::int64_t nPlace) const { return Read(nPlace, mvnCounts); }
    unsigned char GetLayover(std::int64_t nPlace) const { return Read(nPlace, mvnLayover); }
    unsigned char GetShadow(std::int64_t nPlace) const { return Read(nPlace, mvnShadow); }
    /// A counter inside the image.
    std::uint16_t& At(std::int64_t nPlace) { return mvnCounts[static_cast<std::size_t>(nPlace)]; }

private:
    std::size_t PixelCount() const
    {
        return static_cast<std::size_t>(moGrid.mnPixels * moGrid.mnLines);
    }
    template <class T>
    static T Read(std::int64_t nPlace, const std::vector<T>& vnValues)
    {
        const auto nIndex = static_cast<std::uint64_t>(nPlace);
        return nIndex < vnValues.size() ? vnValues[nIndex] : T(0);
    }
    static void SetMark(std::int64_t nPlace, std::vector<unsigned char>& vnMarks)
    {
        const auto nIndex = static_cast<std::uint64_t>(nPlace);
        if (nIndex < vnMarks.size())
        {
            vnMarks[nIndex] = 1;
        }
    }

    RadarGrid moGrid;
    double mdfHalfPixel;
    std::int16_t mnMaxCount = 0;
    std::vector<std::uint16_t> mvnCounts;
    std::vector<unsigned char> mvnLayover;
    std::vector<unsigned char> mvnShadow;
    LineMaxima moMaxima;
};

/// The three rows that pass two makes of a DEM row.
struct ResultRows
{
    explicit ResultRows(std::size_t nWidth)
        : mvdfResults(nWidth), mvnLayover(nWidth), mvnShadow(nWidth)
    {
    }

    std::vector<double> mvdfResults;
    std::vector<unsigned char> mvnLayover;
    std::vector<unsigned char> mvnShadow;
};

}  // namespace

namespace details
{

SarSim2Params::SarSim2Params(std::vector<unsigned int> vnDbiw, std::vector<double> vdfEscale,
                             std::vector<double> vdfAlti, std::vector<double> vdfHead,
                             std::vector<double> vdfMinlook, std::vector<double> vdfNRPoint,
                             std::vector<int> vnOversamp,
                             parallelio::IUpdateHandler* poUpdateHandler)
    : Dbiw(std::move(vnDbiw)),
      Escale(std::move(vdfEscale)),
      Alti(std::move(vdfAlti)),
      Head(std::move(vdfHead)),
      Minlook(std::move(vdfMinlook)),
      NRPoint(std::move(vdfNRPoint)),
      Oversamp(std::move(vnOversamp)),
      mpoUpdateHandler(poUpdateHandler)
{
}

}  // namespace details

/// What the workers for all pairs of types share: all but the types.
class Sarsim2::Worker : public ISarSim2, public details::SarSim2Params
{
    friend class Run;
};

/// One call of Process.
class Sarsim2::Run
{
public:
    /// nIn is the position of the DEM's type among the element types.
    Run(Worker& oParams, datasources::IRasterReader& oReader, const Writers& oWriters,
        std::size_t nIn, Store pfnStore)
        : moParams(oParams),
          moReader(oReader),
          moWriters(oWriters),
          mnIn(nIn),
          mpfnStore(pfnStore),
          mpoHandler(oParams.mpoUpdateHandler)
    {
        moWindow = WindowOf(moParams.Dbiw);
        RequireWindow(moWindow, moReader, kSource);
        RequireRowMemory(moWindow, kRowBytes);
        mvdfRow.resize(static_cast<std::size_t>(moWindow.mnWidth));
        mvfPrevious.resize(mvdfRow.size());
        mvfCurrent.resize(mvdfRow.size());
        mvnSamples.resize(mvdfRow.size() * sizeof(double));
    }

    void Simulate();

private:
    void PlaceNearPoint();
    ElevationRange FindElevations();
    RadarGrid MakeGrid(const ElevationRange& oElevations);
    void ReadRow(std::int64_t nRow);
    void ScaleRow();
    void Update(float fFraction) const;
    bool Report(float fStart, std::int64_t nRow, const ScanOrder& oOrder) const;
    void CountHits(const Projection<kDivision>& oProjection, const ScanOrder& oOrder,
                   HitCounts& oCounts);
    void WriteRows(const Projection<kDivision>& oProjection, const ScanOrder& oOrder,
                   HitCounts& oCounts);
    void FillRow(const RangeColumns<kDivision>& oColumns, const ScanOrder& oOrder,
                 std::int64_t nRow, HitCounts& oCounts, ResultRows& oRows) const;
    double ResultAt(double dfLine, double dfColumn, HitCounts& oCounts) const;
    void Write(const ResultRows& oRows, std::int64_t nRow) const;

    Worker& moParams;
    datasources::IRasterReader& moReader;
    Writers moWriters;
    std::size_t mnIn;
    Store mpfnStore;
    parallelio::IUpdateHandler* mpoHandler;
    DemWindow moWindow;
    Viewpoint moView;
    ScanFrame moFrame{0.0, 0.0, 0.0, 0.0};
    bool mbBytes = false;                   ///< the DEM's samples have 8 bits
    std::vector<unsigned char> mvnSamples;  ///< a row of the DEM's type
    std::size_t mnRowSamples = 0;           ///< those of the row that the DEM has
    std::vector<double> mvdfRow;
    std::vector<float> mvfPrevious;
    std::vector<float> mvfCurrent;
};

/// The near range point, and the DEM's pixels, in the map. Meant: mfWindowLeftX stays 0.
void Sarsim2::Run::PlaceNearPoint()
{
    const ogc::cs::GeocodingInfo& oMap = moReader.GetGeocodingInfo();
    moView.mdfPixelX = RoundedToSingle(std::fabs(oMap.GetXPerCol()));
    moView.mdfPixelY = RoundedToSingle(std::fabs(oMap.GetYPerRow()));
    std::vector<double>& vdfPoint = moParams.NRPoint;
    if (vdfPoint.empty())
    {
        vdfPoint.resize(2);
        oMap.RasterToMap(static_cast<double>(moWindow.mnX), static_cast<double>(moWindow.mnY),
                         vdfPoint[0], vdfPoint[1]);
    }
    double dfCol = 0.0;
    double dfRow = 0.0;
    oMap.MapToRaster(vdfPoint[0], vdfPoint[1], dfCol, dfRow);
    moView.mnNearCol = Truncated(dfCol + 0.5) - moWindow.mnX;
    moView.mnNearRow = Truncated(dfRow + 0.5) - moWindow.mnY;
}

/// Elevations of the DEM, from some of its rows. An offset of 0 becomes the lowest sample.
ElevationRange Sarsim2::Run::FindElevations()
{
    std::vector<double>& vdfScale = moParams.Escale;
    float fLowest = 0.0F;
    float fHighest = 0.0F;
    if (!mbBytes)
    {
        const auto nRoot =
            static_cast<std::int64_t>(std::sqrt(static_cast<float>(moWindow.mnHeight)));
        for (std::int64_t y = 0; y < moWindow.mnHeight; y += std::max<std::int64_t>(nRoot, 1))
        {
            ReadRow(moWindow.mnY + y);
            details::ConvertRow(mnIn, kFloat, mvnSamples.data(), mvfCurrent.data(),
                                mvfCurrent.size());
            for (std::size_t i = 0; i < mvfCurrent.size(); ++i)
            {
                const float fSample = mvfCurrent[i];
                const bool bFirst = y == 0 && i == 0;
                fHighest = bFirst || fSample > fHighest ? fSample : fHighest;
                fLowest = bFirst || fSample < fLowest ? fSample : fLowest;
            }
        }
        if (vdfScale[1] == 0.0)
        {
            vdfScale[1] = static_cast<double>(fLowest);
        }
    }
    const double dfLowest = RoundedToSingle(vdfScale[0] * vdfScale[1]);
    const double dfSpan =
        mbBytes ? vdfScale[0] * 255.0 : static_cast<double>(fHighest) * vdfScale[0];
    return {dfLowest, RoundedToSingle(dfSpan + dfLowest)};
}

RadarGrid Sarsim2::Run::MakeGrid(const ElevationRange& oElevations)
{
    const Projection<kDivision> oProjection(moView, moParams.Alti[0], moParams.Head[0]);
    const double dfNearY = static_cast<double>(moView.mnNearRow) * moView.mdfPixelY;
    const auto oGroundRange = [&](const ScanFrame::Corner& oCorner, double dfElevation)
    { return oProjection.RangesOf(oCorner.x, dfNearY - oCorner.y, dfElevation).mdfGround; };

    RadarGrid oGrid;
    oGrid.mdfNearRange = oGroundRange(moFrame.moNear, oElevations.mdfHighest);
    const double dfFarRange = oGroundRange(moFrame.moFar, oElevations.mdfLowest);
    oGrid.mdfPerRange = 1.0 / moView.mdfPixelX;
    oGrid.mdfPerAzimuth = 1.0 / moView.mdfPixelY;
    oGrid.mdfStart = moFrame.mdfStart;
    oGrid.mbMirror = moFrame.mbMirror;
    oGrid.mnLines =
        ImageSize(std::trunc((moFrame.mdfEnd - moFrame.mdfStart) / moView.mdfPixelY + 0.5) + 1.0,
                  "lines", kSource);
    oGrid.mnPixels =
        ImageSize(std::trunc((dfFarRange - oGrid.mdfNearRange) / moView.mdfPixelX + 0.5 + 1.0),
                  "pixels a line", kSource);
    return oGrid;
}

/// Brings the samples of a row, counted from 0, into mvnSamples; 0 where the row has none.
void Sarsim2::Run::ReadRow(std::int64_t nRow)
{
    const std::unique_ptr<tessel::Raster> poRow(
        moReader.GetRaster(static_cast<unsigned int>(nRow)));
    if (poRow->moDataType != moReader.GetDataType())
    {
        throw Exception("The reader of elevations gave a row of another type than its own", kSource,
                        __PRETTY_FUNCTION__, __LINE__);
    }
    const std::size_t nSampleBytes = poRow->moDataType.GetSampleBytes();
    const unsigned char* pFirst = poRow->GetPixel(0, 0);
    const auto nBytes = static_cast<std::size_t>(poRow->mpBuffer + poRow->mnBufferSize - pFirst);
    mnRowSamples = std::min(nBytes / nSampleBytes, mvdfRow.size());
    const auto itEnd = std::copy_n(pFirst, mnRowSamples * nSampleBytes, mvnSamples.begin());
    std::fill(itEnd, mvnSamples.end(), static_cast<unsigned char>(0));
}

/// Turns the samples into elevations: scaled, and stored as the DEM's type.
void Sarsim2::Run::ScaleRow()
{
    details::ConvertRow(mnIn, kDouble, mvnSamples.data(), mvdfRow.data(), mvdfRow.size());
    for (double& dfSample : mvdfRow)
    {
        dfSample = (dfSample + moParams.Escale[1]) * moParams.Escale[0];
    }
    // What lies behind the row's end cannot be written.
    details::ConvertRow(kDouble, mnIn, mvdfRow.data(), mvnSamples.data(), mnRowSamples);
    details::ConvertRow(mnIn, kFloat, mvnSamples.data(), mvfCurrent.data(), mvfCurrent.size());
}

void Sarsim2::Run::Update(float fFraction) const
{
    if (mpoHandler != nullptr)
    {
        mpoHandler->Update(fFraction);
    }
}

/// Tells the progress of a pass that starts at fStart and makes out 0.4 of the run. False when the
/// run is cancelled.
bool Sarsim2::Run::Report(float fStart, std::int64_t nRow, const ScanOrder& oOrder) const
{
    if (mpoHandler != nullptr && mpoHandler->IsCancelled())
    {
        return false;
    }
    const auto fRows = static_cast<float>(oOrder.mnLastRow - oOrder.mnFirstRow + oOrder.mnRowStep);
    Update(fStart + 0.4F * static_cast<float>(nRow - oOrder.mnFirstRow) / fRows);
    return true;
}

/// Pass one.
void Sarsim2::Run::CountHits(const Projection<kDivision>& oProjection, const ScanOrder& oOrder,
                             HitCounts& oCounts)
{
    TerrainScan<kDivision> oScan(oProjection, moWindow, oOrder, moFrame, oCounts.GetGrid(),
                                 moParams.Oversamp[0]);
    const std::int64_t nBehindLast = oOrder.mnLastRow + oOrder.mnRowStep;
    for (std::int64_t nRow = oOrder.mnFirstRow; nRow != nBehindLast; nRow += oOrder.mnRowStep)
    {
        if (!Report(0.2F, nRow, oOrder))
        {
            return;
        }
        mvfPrevious.swap(mvfCurrent);
        ReadRow(nRow - 1);
        ScaleRow();
        if (nRow != oOrder.mnFirstRow)
        {
            oScan.ScanRow(nRow, mvfPrevious, mvfCurrent, {}, oCounts);
        }
    }
}

/// The result where a DEM pixel falls. What is read of an 8-bit DEM is replaced.
double Sarsim2::Run::ResultAt(double dfLine, double dfColumn, HitCounts& oCounts) const
{
    const RadarGrid& oGrid = oCounts.GetGrid();
    const std::int64_t nLine = Truncated(dfLine + 0.5);
    const std::int64_t nColumn = Truncated(dfColumn + 0.5);
    const std::int64_t nBase = oCounts.PlaceOf(Truncated(dfLine), Truncated(dfColumn));
    const float fInvMax = oCounts.GetInvMax();
    const auto oCompressed = [fInvMax](std::uint16_t nCount)
    { return static_cast<double>(std::sqrt(static_cast<float>(nCount) * fInvMax)) * 255.0; };
    if (nColumn < 2 || nColumn > oGrid.mnPixels - 1 || nLine < 2 || nLine > oGrid.mnLines - 1)
    {
        const std::uint16_t nCount = oCounts.GetCount(nBase);
        return mbBytes ? oCompressed(nCount) : static_cast<double>(nCount);
    }
    float afCounts[4];
    const std::int64_t anPlaces[] = {nBase, nBase + 1, nBase + oGrid.mnPixels,
                                     nBase + oGrid.mnPixels + 1};
    for (std::size_t i = 0; i < 4; ++i)
    {
        std::uint16_t& nCount = oCounts.At(anPlaces[i]);
        if (mbBytes)
        {
            nCount = static_cast<std::uint16_t>(Truncated(oCompressed(nCount)));
        }
        afCounts[i] = static_cast<float>(nCount);
    }
    const float a = static_cast<float>(dfColumn) - static_cast<float>(Truncated(dfColumn));
    const float b = static_cast<float>(dfLine) - static_cast<float>(Truncated(dfLine));
    const float fValue = afCounts[1] * (a * (1.0F - b)) + afCounts[0] * ((1.0F - a) * (1.0F - b)) +
                         afCounts[2] * (b * (1.0F - a)) + afCounts[3] * (b * a);
    return static_cast<double>(fValue) + 0.5;
}

void Sarsim2::Run::FillRow(const RangeColumns<kDivision>& oColumns, const ScanOrder& oOrder,
                           std::int64_t nRow, HitCounts& oCounts, ResultRows& oRows) const
{
    const RadarGrid& oGrid = oCounts.GetGrid();
    const double dfDown =
        (static_cast<double>(nRow - moWindow.mnY) - 1.0) * moFrame.mdfCosHead * moView.mdfPixelY;
    // Meant: rows are not multiplied by the pixel size here.
    const double dfNorth = moView.mdfPixelY * static_cast<double>(moView.mnNearRow) -
                           static_cast<double>(nRow) + static_cast<double>(moWindow.mnY);
    const std::int64_t nBehindLast = oOrder.mnLastCol + oOrder.mnColStep;
    for (std::int64_t nCol = oOrder.mnFirstCol; nCol != nBehindLast; nCol += oOrder.mnColStep)
    {
        const auto i = static_cast<std::size_t>(nCol - 1);
        const double z = (mvdfRow[i] + moParams.Escale[1]) * moParams.Escale[0];
        const double dfAlong =
            (static_cast<double>(nCol) - 1.0) * moFrame.mdfSinHead * moView.mdfPixelX - dfDown -
            oGrid.mdfStart;
        // Meant: lines of x pixels, not of y pixels.
        const double dfLine = dfAlong * oGrid.mdfPerRange + 1.0;
        const double dfGround = oColumns.RangesOf(i, dfNorth, z).mdfGround;
        const double dfUnmirrored = (dfGround - oGrid.mdfNearRange) * oGrid.mdfPerRange + 1.0;
        const double dfColumn =
            oGrid.mbMirror ? static_cast<double>(oGrid.mnPixels) - dfUnmirrored : dfUnmirrored;
        oRows.mvdfResults[i] = ResultAt(dfLine, dfColumn, oCounts);
        const std::int64_t nMark =
            oCounts.PlaceOf(Truncated(dfLine + 0.5), Truncated(dfColumn + 0.5));
        oRows.mvnLayover[i] = oCounts.GetLayover(nMark);
        oRows.mvnShadow[i] = oCounts.GetShadow(nMark);
    }
}

void Sarsim2::Run::Write(const ResultRows& oRows, std::int64_t nRow) const
{
    const auto oMake = [&](const datasources::IRasterWriter& oWriter)
    {
        auto poRow = std::make_unique<tessel::Raster>(
            tessel::RasterInfo(static_cast<std::uint32_t>(moWindow.mnWidth), 1, 1,
                               oWriter.GetDataType()),
            tessel::RasterContext(0, 0, static_cast<std::uint32_t>(moWindow.mnX),
                                  static_cast<std::uint32_t>(nRow - 1)));
        std::fill_n(poRow->mpBuffer, poRow->mnBufferSize, static_cast<unsigned char>(0));
        return poRow;
    };
    const auto oMark =
        [&](datasources::IRasterWriter& oWriter, const std::vector<unsigned char>& vnMarks)
    {
        const auto poRow = oMake(oWriter);
        for (std::size_t i = 0; i < vnMarks.size(); ++i)
        {
            poRow->mpBuffer[i * poRow->moDataType.GetSampleBytes()] = vnMarks[i];
        }
        oWriter.WriteRaster(poRow.get());
    };
    const auto poImageRow = oMake(moWriters.moImage);
    mpfnStore(oRows.mvdfResults, poImageRow->mpBuffer);
    moWriters.moImage.WriteRaster(poImageRow.get());
    oMark(moWriters.moShadow, oRows.mvnShadow);
    oMark(moWriters.moLayover, oRows.mvnLayover);
}

/// Pass two.
void Sarsim2::Run::WriteRows(const Projection<kDivision>& oProjection, const ScanOrder& oOrder,
                             HitCounts& oCounts)
{
    RangeColumns<kDivision> oColumns(oProjection, oCounts.GetGrid());
    for (std::int64_t nCol = 1; nCol <= moWindow.mnWidth; ++nCol)
    {
        // Meant: one pixel further than in pass one.
        oColumns.Append(static_cast<double>(nCol) * moView.mdfPixelX);
    }
    ResultRows oRows(mvdfRow.size());
    const std::int64_t nBehindLast = oOrder.mnLastRow + oOrder.mnRowStep;
    for (std::int64_t nRow = oOrder.mnFirstRow; nRow != nBehindLast; nRow += oOrder.mnRowStep)
    {
        if (!Report(0.6F, nRow, oOrder))
        {
            return;
        }
        ReadRow(nRow - 1);
        details::ConvertRow(mnIn, kDouble, mvnSamples.data(), mvdfRow.data(), mvdfRow.size());
        FillRow(oColumns, oOrder, nRow, oCounts, oRows);
        Write(oRows, nRow);
    }
}

void Sarsim2::Run::Simulate()
{
    Update(0.0F);
    moReader.SetTileSize(moReader.GetWidth(), 1);
    for (datasources::IRasterWriter* poWriter :
         {&moWriters.moImage, &moWriters.moLayover, &moWriters.moShadow})
    {
        poWriter->SetTileSize(poWriter->GetWidth(), 1);
    }
    mbBytes = ChannelBits(moReader, kSource) == 8;
    PlaceNearPoint();
    const double dfHeading = moParams.Head[0];
    moFrame = ScanFrame(dfHeading, kPi * dfHeading * kInv180,
                        static_cast<double>(moWindow.mnWidth - 1) * moView.mdfPixelX,
                        static_cast<double>(moWindow.mnHeight - 1) * moView.mdfPixelY);
    moView.mfSideSign = moFrame.mfSideSign;
    SetOrbit(moParams.Alti[0], kPi * moParams.Minlook[0] * kInv180, moView);
    const RadarGrid oGrid = MakeGrid(FindElevations());
    RequireMemory(HitCounts::GetBytes(oGrid) + LineMaxima::GetBytes(moWindow.mnWidth) +
                      TerrainScan<kDivision>::GetBytes(moWindow, moParams.Oversamp[0]),
                  "A radar image of " + std::to_string(oGrid.mnPixels) + " x " +
                      std::to_string(oGrid.mnLines) + " pixels");
    HitCounts oCounts(oGrid, moView.mdfPixelX, moWindow);
    Update(0.2F);
    const ScanOrder oOrder(dfHeading, moWindow);
    const Projection<kDivision> oProjection(moView, moParams.Alti[0], dfHeading);
    CountHits(oProjection, oOrder, oCounts);
    Update(0.6F);
    WriteRows(oProjection, oOrder, oCounts);
    Update(1.0F);
}

template <class TIn, class TOut>
class Sarsim2::InnerProcessor : public Worker
{
public:
    void Process(datasources::IRasterReader* poReader, datasources::IRasterWriter* poRasterWriter,
                 datasources::IRasterWriter* poLayoverWriter,
                 datasources::IRasterWriter* poShadowWriter) override
    {
        Run(*this, *poReader, {*poRasterWriter, *poLayoverWriter, *poShadowWriter},
            typedispatch::ElementPosition<TIn>(), StoreCut<TOut>)
            .Simulate();
    }
};

Sarsim2::Sarsim2(std::vector<unsigned int> vnDbiw, std::vector<double> vdfEscale,
                 std::vector<double> vdfAlti, std::vector<double> vdfHead,
                 std::vector<double> vdfMinlook, std::vector<double> vdfNRPoint,
                 std::vector<int> vnOversamp, parallelio::IUpdateHandler* const poUpdateHandler)
    : SarSim2Params(std::move(vnDbiw), std::move(vdfEscale), std::move(vdfAlti), std::move(vdfHead),
                    std::move(vdfMinlook), std::move(vdfNRPoint), std::move(vnOversamp),
                    poUpdateHandler)
{
}

void Sarsim2::RequireParameters() const
{
    RequireValues(Dbiw, 4, "Dbiw", kSource);
    RequireValues(Escale, 2, "Escale", kSource);
    RequireValues(Alti, 1, "Alti", kSource);
    RequireValues(Head, 1, "Head", kSource);
    RequireValues(Minlook, 1, "Minlook", kSource);
    RequireValues(Oversamp, 1, "Oversamp", kSource);
    if (!NRPoint.empty())
    {
        RequireValues(NRPoint, 2, "NRPoint", kSource);
    }
}

void Sarsim2::Process(datasources::IRasterReader* poReader,
                      datasources::IRasterWriter* poRasterWriter,
                      datasources::IRasterWriter* poLayoverWriter,
                      datasources::IRasterWriter* poShadowWriter)
{
    const std::pair<const void*, const char*> kPointers[] = {{poReader, "poReader"},
                                                             {poRasterWriter, "poRasterWriter"},
                                                             {poLayoverWriter, "poLayoverWriter"},
                                                             {poShadowWriter, "poShadowWriter"}};
    for (const auto& [pPointer, pszName] : kPointers)
    {
        if (pPointer == nullptr)
        {
            throw Exception(std::string(pszName) + " is invalid pointer", kSource,
                            __PRETTY_FUNCTION__, __LINE__);
        }
    }
    using Factory = typedispatch::Factory2Template<InnerProcessor, ISarSim2>;
    const auto oMake = [this](const tessel::DataType& oIn, const tessel::DataType& oOut)
    {
        // Here, so that a worker whose lists are too short is not kept.
        RequireParameters();
        return typedispatch::DispatchTypePair<Factory>(oIn, oOut, false);
    };
    SelectProcessor<details::SarSim2Params>(poReader->GetDataType(), poRasterWriter->GetDataType(),
                                            *this, oMake);
    // Held here: a handler may set this object up anew while the worker runs.
    const std::shared_ptr<ISarSim2> poWorker = mpoProcessor;
    poWorker->Process(poReader, poRasterWriter, poLayoverWriter, poShadowWriter);
}

}  // namespace kor::filters
