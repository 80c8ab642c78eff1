#include "processes/qrdfilters/filterhomogeneity.h"

#include <algorithm>
#include <array>
#include <limits>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/datasources/irasterreader.h"
#include "platform/datasources/irasterwriter.h"
#include "platform/exception/exception.h"
#include "platform/system/translate.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/cutsample.h"
#include "processes/qrdfilters/kernels/greypairs.h"
#include "processes/qrdfilters/samplerows.h"
#include "processes/qrdfilters/texture/greylevels.h"

namespace kor::filters
{

using kernels::GreyRows;
using kernels::kPairPadding;
using kernels::kPairRows;
using kernels::PairSums;
using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterhomogeneity";
constexpr std::size_t kDouble = typedispatch::ElementPosition<double>();

void Require(bool bHolds, const char* pszMessage)
{
    if (!bHolds)
    {
        throw Exception(_(pszMessage), "", "", 0);
    }
}

/// Adds nMore to a count, which ends at the greatest int.
void Count(int& nCount, std::int64_t nMore)
{
    nCount =
        static_cast<int>(std::min<std::int64_t>(nCount + nMore, std::numeric_limits<int>::max()));
}

/// Rows of grey levels of a block and its margins, as long as pairs need them. Rows are counted
/// from the first one of the margin.
class GreyRing
{
public:
    GreyRing(const Raster& oIn, std::size_t nType, const Mask* poMask, const GreyLevels& oLevels)
        : moIn(oIn),
          mnType(nType),
          mpoMask(poMask),
          moLevels(oLevels),
          mnColumns(oIn.mnTotalWidth),
          mnStride(mnColumns + 2 * kPairPadding),
          mnSlots(2 * std::max<std::size_t>(oIn.mnMarginX, oIn.mnMarginY) + 2 + kPairRows),
          mvfGrey(mnSlots * mnStride),
          mvfValid((poMask != nullptr ? mnSlots : 1) * mnStride),
          mvfNothing(mnStride),
          mvdfSamples(mnColumns),
          mvValid(mnColumns)
    {
        if (poMask == nullptr)
        {
            std::fill_n(mvfValid.begin() + kPairPadding, mnColumns, 1.0F);
        }
    }

    std::size_t Rows() const { return moIn.mnTotalHeight; }

    /// Row r, which lies in the block, and the one below it, which need not.
    GreyRows At(std::size_t r)
    {
        const float* const pfNothing = &mvfNothing[kPairPadding];
        const bool bLast = r + 1 == Rows();
        LoadUpTo(bLast ? r : r + 1);
        return {Grey(r), Valid(r), bLast ? pfNothing : Grey(r + 1),
                bLast ? pfNothing : Valid(r + 1)};
    }

    /// 1 or 0 a pixel of row r.
    float* Valid(std::size_t r)
    {
        return &mvfValid[(mpoMask != nullptr ? r % mnSlots : 0) * mnStride + kPairPadding];
    }

private:
    float* Grey(std::size_t r) { return &mvfGrey[r % mnSlots * mnStride + kPairPadding]; }

    void LoadUpTo(std::size_t r)
    {
        for (; mnLoaded <= r; ++mnLoaded)
        {
            Load(mnLoaded);
        }
    }

    void Load(std::size_t r)
    {
        const std::int64_t x = -std::int64_t{moIn.mnMarginX};
        const std::int64_t y = static_cast<std::int64_t>(r) - moIn.mnMarginY;
        details::ConvertRow(mnType, kDouble, moIn.GetPixel(x, y), mvdfSamples.data(), mnColumns);
        moLevels.LookUpInRange(mvdfSamples, Grey(r));
        if (mpoMask != nullptr)
        {
            mpoMask->ExpandRow(x, y, mvValid);
            std::copy(mvValid.begin(), mvValid.end(), Valid(r));
        }
    }

    const Raster& moIn;
    std::size_t mnType;
    const Mask* mpoMask;
    const GreyLevels& moLevels;
    std::size_t mnColumns;
    std::size_t mnStride;
    std::size_t mnSlots;
    std::size_t mnLoaded = 0;
    std::vector<float> mvfGrey;
    std::vector<float> mvfValid;
    std::vector<float> mvfNothing;  ///< below the last row
    std::vector<double> mvdfSamples;
    std::vector<unsigned char> mvValid;
};

/// Sums and counts of kPairRows rows.
class PairBatch
{
public:
    explicit PairBatch(std::size_t nColumns)
    {
        // Rows that begin in different lines of the cache: a power of two would put all of them
        // into the same few.
        constexpr std::size_t kLine = 16;
        const std::size_t nStride = nColumns + kLine;
        mvfSums.resize(kPairRows * nStride);
        mvfCounts.resize(kPairRows * nStride);
        for (std::size_t k = 0; k < kPairRows; ++k)
        {
            maoRows[k] = {mvfSums.data() + k * nStride, mvfCounts.data() + k * nStride};
        }
    }
    PairBatch(const PairBatch&) = delete;
    PairBatch& operator=(const PairBatch&) = delete;

    const PairSums& Row(std::size_t k) const { return maoRows[k % kPairRows]; }
    const PairSums* Rows() const { return maoRows.data(); }

private:
    std::vector<float> mvfSums;
    std::vector<float> mvfCounts;
    std::array<PairSums, kPairRows> maoRows{};
};

/// Homogeneity of one block, batch of rows by batch.
class HomogeneityRows
{
public:
    HomogeneityRows(const Raster& oIn, std::size_t nType, const Mask* poMask,
                    const GreyLevels& oLevels)
        : moRing(oIn, nType, poMask, oLevels),
          mnMarginX(oIn.mnMarginX),
          mnMarginY(oIn.mnMarginY),
          mnWidth(oIn.mnWidth),
          mnHeight(oIn.mnHeight),
          mnPairColumns(oIn.mnTotalWidth - 1),
          mbExact(oLevels.GetSpan() <= kernels::kExactDifference),
          moColumns(oIn.mnTotalWidth),
          moWindows(oIn.mnWidth)
    {
        // Twice the margin in x, of rows: meant, margins are equal.
        for (std::size_t r = 0; r < std::min(2 * mnMarginX, moRing.Rows()); ++r)
        {
            const PairSums& oBefore = moColumns.Row(kPairRows - 1);
            kernels::AddPairs(moRing.At(r), mbExact, mnPairColumns, oBefore, oBefore);
        }
    }

    /// Calls oWrite(y, pfRow) for each row of the block.
    template <class Write>
    void MakeAll(const Write& oWrite)
    {
        for (std::size_t nFirst = 0; nFirst < mnHeight; nFirst += kPairRows)
        {
            const std::size_t nEnd = std::min(nFirst + kPairRows, mnHeight);
            for (std::size_t k = nFirst; k < nEnd; ++k)
            {
                MoveColumns(k);
            }
            // Of a batch that is not full the other rows are worked on for nothing.
            kernels::SlidePairs(moColumns.Rows(), 2 * mnMarginX + 1, mnWidth, moWindows.Rows());
            for (std::size_t k = nFirst; k < nEnd; ++k)
            {
                const PairSums& oRow = moWindows.Row(k);
                kernels::DividePairs(oRow.mpfSums, oRow.mpfCounts,
                                     moRing.Valid(k + mnMarginY) + mnMarginX, mnWidth,
                                     oRow.mpfSums);
                oWrite(k, oRow.mpfSums);
            }
        }
    }

private:
    /// The sums of the columns for row k: those of the row before, moved on by a row.
    void MoveColumns(std::size_t k)
    {
        const PairSums& oBefore = moColumns.Row(k + kPairRows - 1);
        const PairSums& oHere = moColumns.Row(k);
        const GreyRows oEntering = moRing.At(2 * mnMarginY + k);
        if (k == 0)
        {
            kernels::AddPairs(oEntering, mbExact, mnPairColumns, oBefore, oHere);
        }
        else
        {
            kernels::MovePairs(moRing.At(k - 1), oEntering, mbExact, mnPairColumns, oBefore, oHere);
        }
    }

    GreyRing moRing;
    std::size_t mnMarginX;
    std::size_t mnMarginY;
    std::size_t mnWidth;
    std::size_t mnHeight;
    std::size_t mnPairColumns;
    bool mbExact;
    PairBatch moColumns;
    PairBatch moWindows;
};

/// Stores homogeneities as samples of type TOut.
template <class TOut>
void StoreHomogeneity(std::span<const float> oRow, void* pOut)
{
    auto* const pTo = static_cast<TOut*>(pOut);
    if constexpr (std::is_floating_point_v<TOut>)
    {
        ConvertSamples<float, TOut>(oRow.data(), pTo, oRow.size());
    }
    else
    {
        for (std::size_t i = 0; i < oRow.size(); ++i)
        {
            pTo[i] = CutSample<double, TOut>(static_cast<double>(oRow[i]) + 0.5);
        }
    }
}

/// What all pairs of types share.
class HomogeneityProcessor : public IProcessor, public details::HomogeneityParams
{
public:
    void Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const override
    {
        const Raster& oIn = *poRasterIn;
        RequireMatchingBlocks(oIn, poMask, *poRasterOut, nullptr, kSource);
        if (oIn.mnWidth == 0 || oIn.mnHeight == 0)
        {
            return;
        }
        const GreyLevels oLevels(mdfMin, mdfMax, mvnHist2Glev);
        HomogeneityRows oRows(oIn, mnType, poMask, oLevels);
        const auto oWrite = [&](std::size_t y, const float* pfRow) {
            mpfnStore({pfRow, oIn.mnWidth}, poRasterOut->GetPixel(0, static_cast<std::int64_t>(y)));
        };
        oRows.MakeAll(oWrite);
    }

protected:
    using Store = void (*)(std::span<const float>, void*);

    HomogeneityProcessor(std::size_t nType, Store pfnStore) : mnType(nType), mpfnStore(pfnStore) {}

private:
    std::size_t mnType;
    Store mpfnStore;
};

/// What all types share.
class GreyPreparator : public details::IPreparationHomogeneity, public details::HomogeneityParams
{
public:
    void ProcessMinMax(Raster* poRaster, Mask* poMask) override
    {
        const auto oRow = [&](std::size_t /*y*/, std::span<const double> vdfSamples,
                              std::span<const unsigned char> oValid)
        {
            for (std::size_t i = 0; i < vdfSamples.size(); ++i)
            {
                const double x = vdfSamples[i];
                mdfMax = oValid[i] != 0 && x > mdfMax ? x : mdfMax;
                mdfMin = oValid[i] != 0 && x < mdfMin ? x : mdfMin;
            }
        };
        ForEachRow(*poRaster, poMask, oRow);
    }

    void Process16Histogram(Raster* poRaster, Mask* poMask) override
    {
        const kernels::GreyScale oScale = ScaleOf(mdfMin, mdfMax, mvnHistogram.size());
        std::vector<int> vnBins(poRaster->mnWidth);
        const auto oRow = [&](std::size_t /*y*/, std::span<const double> vdfSamples,
                              std::span<const unsigned char> oValid)
        {
            std::int64_t nCount = 0;
            kernels::FindBins(oScale, vdfSamples, vnBins.data());
            for (std::size_t i = 0; i < vdfSamples.size(); ++i)
            {
                nCount += oValid[i];
                if (oValid[i] != 0 && vnBins[i] >= 0)
                {
                    Count(mvnHistogram[static_cast<std::size_t>(vnBins[i])], 1);
                }
            }
            Count(mnCount, nCount);
        };
        ForEachRow(*poRaster, poMask, oRow);
    }

    void DumpGrey(Raster* poRaster, Mask* poMask, Raster* poGrey) override
    {
        const GreyLevels oLevels(mdfMin, mdfMax, mvnHist2Glev);
        const auto oRow = [&](std::size_t y, std::span<const double> vdfSamples,
                              std::span<const unsigned char> oValid)
        {
            auto* const pfGrey = poGrey->GetPixelAs<float>(0, static_cast<std::int64_t>(y));
            oLevels.LookUp(vdfSamples, pfGrey);
            for (std::size_t i = 0; i < oValid.size(); ++i)
            {
                pfGrey[i] = oValid[i] != 0 ? pfGrey[i] : 0.0F;
            }
        };
        ForEachRow(*poRaster, poMask, oRow);
    }

protected:
    explicit GreyPreparator(std::size_t nType) : mnType(nType) {}

private:
    /// Calls oWork(y, vdfSamples, oValid) for each row.
    template <class Work>
    void ForEachRow(const Raster& oRaster, const Mask* poMask, const Work& oWork) const
    {
        std::vector<double> vdfSamples(oRaster.mnWidth);
        std::vector<unsigned char> vValid(oRaster.mnWidth, 1);
        for (std::uint32_t y = 0; y < oRaster.mnHeight; ++y)
        {
            details::ConvertRow(mnType, kDouble, oRaster.GetPixel(0, y), vdfSamples.data(),
                                vdfSamples.size());
            if (poMask != nullptr)
            {
                poMask->ExpandRow(0, y, vValid);
            }
            oWork(y, vdfSamples, vValid);
        }
    }

    std::size_t mnType;
};

/// Calls oWork(poBlock, poMask) for each block of an image.
template <class Work>
void ForEachBlock(datasources::IRasterReader& oReader, const tessel::IMaskBuilder* poMaskBuilder,
                  const Work& oWork)
{
    const datasources::RasterIterator itEnd = oReader.End();
    for (datasources::RasterIterator it = oReader.Begin(); it != itEnd; ++it)
    {
        const std::unique_ptr<Raster> poBlock(*it);
        const std::unique_ptr<Mask> poMask(
            poMaskBuilder != nullptr ? poMaskBuilder->BuildMask(*poBlock) : nullptr);
        oWork(poBlock.get(), poMask.get());
    }
}

}  // namespace

template <class TIn, class TOut>
class FilterHomogeneity::InnerProcessor : public HomogeneityProcessor
{
public:
    InnerProcessor()
        : HomogeneityProcessor(typedispatch::ElementPosition<TIn>(), StoreHomogeneity<TOut>)
    {
    }
};

template <class T>
class FilterHomogeneity::InnerPreparator : public GreyPreparator
{
public:
    InnerPreparator() : GreyPreparator(typedispatch::ElementPosition<T>()) {}
};

void details::HomogeneityParams::Reset()
{
    mnCount = 0;
    mdfMin = std::numeric_limits<double>::max();
    mdfMax = std::numeric_limits<double>::lowest();
    mvnHistogram.assign(kGreyBins, 0);
    mvnHist2Glev.assign(kGreyBins, 0);
}

void details::HomogeneityParams::SetGrey(int nGrey)
{
    Require(static_cast<unsigned int>(nGrey) <= 255U, "Invalid grey level, must be in [0,255].");
    mnGrey = nGrey;
}

void details::HomogeneityParams::SetMinMax(double dfMin, double dfMax)
{
    mdfMin = dfMin;
    mdfMax = dfMax;
}

void FilterHomogeneity::PrepareForGivenGreyLevel(datasources::IRasterReader* poReader,
                                                 tessel::IMaskBuilder* poMaskBuilder,
                                                 datasources::IRasterWriter* poWriter)
{
    if (mnGrey == 0)
    {
        return;
    }
    Require(poReader != nullptr, "Invalid input reader");
    Require(poReader->GetChannelCount() == 1,
            "Input for homogeneity filter supports only 1 channel");
    details::HomogeneityParams& oPrepared = SelectPreparator(poReader->GetDataType());
    oPrepared.SetGrey(mnGrey);
    oPrepared.Reset();
    Reset();
    ForEachBlock(*poReader, poMaskBuilder,
                 [&](Raster* poBlock, Mask* poMask)
                 { mpoPreparator->ProcessMinMax(poBlock, poMask); });
    SetMinMax(oPrepared.GetMin(), oPrepared.GetMax());
    ForEachBlock(*poReader, poMaskBuilder,
                 [&](Raster* poBlock, Mask* poMask)
                 { mpoPreparator->Process16Histogram(poBlock, poMask); });
    mnCount = oPrepared.GetCount();
    mvnHistogram = oPrepared.Get16Histogram();
    mvnHist2Glev = MakeGreyTable(mvnHistogram, mnCount, mnGrey);
    if (poWriter != nullptr && poWriter->GetChannelCount() == 1)
    {
        Require(poWriter->GetDataType() == tessel::eDT_32R, "Invalid grey level writer");
        oPrepared.SetHist2Glev(mvnHist2Glev);
        WriteGrey(*poReader, poMaskBuilder, *poWriter);
    }
}

details::HomogeneityParams& FilterHomogeneity::SelectPreparator(const tessel::DataType& oType)
{
    using Factory =
        typedispatch::Factory1Template<InnerPreparator, details::IPreparationHomogeneity>;
    using Dispatch = typedispatch::ExtendDispatchTypes<Factory, 1, typedispatch::StandardTypeList,
                                                       typedispatch::StandardTypeList,
                                                       typedispatch::typeconv::priv::NullDataType>;
    if (mpoPreparator == nullptr || moPreparedType != oType)
    {
        mpoPreparator.reset();
        moPreparedType = oType;
        mpoPreparator.reset(Dispatch::Dispatch({oType}, false));
    }
    return dynamic_cast<details::HomogeneityParams&>(*mpoPreparator);
}

void FilterHomogeneity::WriteGrey(datasources::IRasterReader& oReader,
                                  const tessel::IMaskBuilder* poMaskBuilder,
                                  datasources::IRasterWriter& oWriter) const
{
    const auto oWrite = [&](Raster* poBlock, Mask* poMask)
    {
        tessel::RasterInfo oInfo = *poBlock;
        oInfo.moDataType = oWriter.GetDataType();
        Raster oGrey(oInfo, *poBlock);
        mpoPreparator->DumpGrey(poBlock, poMask, &oGrey);
        oWriter.WriteRaster(&oGrey);
    };
    ForEachBlock(oReader, poMaskBuilder, oWrite);
}

void FilterHomogeneity::Process(Raster* poRasterIn, Mask* poMask, Raster* poRasterOut) const
{
    Require(poRasterIn != nullptr, "Invalid input Raster");
    Require(poRasterOut != nullptr, "Invalid output raster");
    Require(poRasterIn->mnChannels == 1, "Input for homogeneity filter supports only 1 channel");
    Require(poRasterIn->mnChannels == poRasterOut->mnChannels,
            "Input and output must have the same number of channels");

    SelectProcessor<InnerProcessor, details::HomogeneityParams>(poRasterIn->moDataType,
                                                                poRasterOut->moDataType, *this);
    // Unlike in other filters, the processor gets the table of each call.
    auto& oParams = dynamic_cast<details::HomogeneityParams&>(*mpoProcessor);
    oParams.SetGrey(mnGrey);
    oParams.SetMinMax(mdfMin, mdfMax);
    oParams.SetHist2Glev(mvnHist2Glev);
    mpoProcessor->Process(poRasterIn, poMask, poRasterOut);
}

}  // namespace kor::filters
