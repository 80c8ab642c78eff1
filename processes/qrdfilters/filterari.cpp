#include "processes/qrdfilters/filterari.h"

#include <algorithm>
#include <cstring>
#include <optional>
#include <span>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/blockcontract.h"
#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/kernels/arirow.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

using kernels::AriExtremes;
using kernels::AriOperation;
using kernels::AriRow;
using tessel::Mask;
using tessel::Raster;

namespace
{

constexpr const char* kSource = "processes/qrdfilters/filterari";

constexpr const char* kNoValues = "You have to Set the values before calling Process.";

// Pixels that are worked on at a time: their values stay in the first-level cache.
constexpr std::size_t kChunk = 1024;
constexpr std::size_t kFloat = typedispatch::ElementPosition<float>();

void Require(bool bHolds, const char* pszMessage, const char* pszFunction, unsigned int nLine)
{
    if (!bHolds)
    {
        throw Exception(pszMessage, kSource, pszFunction, nLine);
    }
}

/// The element at nIndex, 0 where the list ends before.
template <class T>
T ElementOf(const std::vector<T>& vList, std::size_t nIndex)
{
    return nIndex < vList.size() ? vList[nIndex] : T(0);
}

/// The operation behind an operator; none for an unknown one.
std::optional<AriOperation> OperationOf(unsigned int nOper, bool bTwoChannels)
{
    static constexpr AriOperation kOfOne[] = {AriOperation::eSum,     AriOperation::eDifference,
                                              AriOperation::eProduct, AriOperation::eQuotient,
                                              AriOperation::eAnd,     AriOperation::eOr};
    if (nOper < 1 || nOper > std::size(kOfOne))
    {
        return std::nullopt;
    }
    if (bTwoChannels && nOper == 1)
    {
        return AriOperation::eSumPlusConstant;
    }
    if (bTwoChannels && nOper == 2)
    {
        return AriOperation::eDifferenceConstant;
    }
    return kOfOne[nOper - 1];
}

/// The first kBytes of each of nPixels pixels of nStride bytes, side by side.
template <std::size_t kBytes>
void GatherFront(const unsigned char* pPixels, std::size_t nStride, std::size_t nPixels,
                 unsigned char* pOut)
{
    for (std::size_t i = 0; i < nPixels; ++i)
    {
        std::memcpy(pOut + i * kBytes, pPixels + i * nStride, kBytes);
    }
}

using Gather = void (*)(const unsigned char*, std::size_t, std::size_t, unsigned char*);

Gather FindGather(std::size_t nBytes)
{
    switch (nBytes)
    {
        case 1:
            return GatherFront<1>;
        case 2:
            return GatherFront<2>;
        case 4:
            return GatherFront<4>;
        case 8:
            return GatherFront<8>;
        default:
            return GatherFront<16>;
    }
}

/// Copies samples of the size of Word to the pixels, nStride bytes apart, where oValid is 1.
template <class Word>
void StoreValid(std::span<const unsigned char> oValid, const unsigned char* pFrom,
                unsigned char* pPixels, std::size_t nStride)
{
    for (std::size_t i = 0; i < oValid.size(); ++i)
    {
        Word nNew = 0;
        Word nOld = 0;
        std::memcpy(&nNew, pFrom + i * sizeof(Word), sizeof(Word));
        std::memcpy(&nOld, pPixels + i * nStride, sizeof(Word));
        nNew = oValid[i] != 0 ? nNew : nOld;
        std::memcpy(pPixels + i * nStride, &nNew, sizeof(Word));
    }
}

using Store = void (*)(std::span<const unsigned char>, const unsigned char*, unsigned char*,
                       std::size_t);

Store FindStore(std::size_t nBytes)
{
    switch (nBytes)
    {
        case 1:
            return StoreValid<std::uint8_t>;
        case 2:
            return StoreValid<std::uint16_t>;
        case 4:
            return StoreValid<std::uint32_t>;
        default:
            return StoreValid<std::uint64_t>;
    }
}

/// What to do with a block.
struct AriWork
{
    std::optional<AriOperation> meOperation;
    AriRow moRow;                ///< its operation is meOperation
    bool mbStoresInput = false;  ///< a statistics run
    std::size_t mnIn = 0;        ///< element types, by their positions in StandardTypeList
    std::size_t mnOut = 0;
};

/// The evaluation of one block, chunk by chunk. Nothing here is compiled for a pair of types.
class AriBlock
{
public:
    AriBlock(const AriWork& oWork, const Raster& oIn, const Mask* poMask, const Raster& oOut,
             const AriExtremes& oExtremes)
        : moWork(oWork),
          moIn(oIn),
          mpoMask(poMask),
          moOut(oOut),
          mnSampleBytesIn(oIn.moDataType.GetSampleBytes()),
          mnPixelBytesIn(mnSampleBytesIn * oIn.mnChannels),
          mnPixelBytesOut(oOut.moDataType.GetSampleBytes() * oOut.mnChannels),
          moExtremes(oExtremes),
          mvFronts(2 * kChunk * mnSampleBytesIn),
          mvStored(kChunk * oOut.moDataType.GetSampleBytes()),
          mvValid(kChunk, 1),
          mvfPairs(2 * kChunk),
          mvfA(kChunk),
          mvfB(kChunk, oWork.moRow.mfConstant),
          mvfOut(kChunk)
    {
    }

    void EvaluateAll()
    {
        for (std::uint32_t y = 0; y < moIn.mnHeight; ++y)
        {
            for (std::size_t x = 0; x < moIn.mnWidth; x += kChunk)
            {
                EvaluateChunk(x, y, std::min<std::size_t>(kChunk, moIn.mnWidth - x));
            }
        }
    }

    const AriExtremes& GetExtremes() const { return moExtremes; }

private:
    void EvaluateChunk(std::size_t x, std::uint32_t y, std::size_t nPixels)
    {
        const std::span<unsigned char> oValid(mvValid.data(), nPixels);
        if (mpoMask != nullptr)
        {
            mpoMask->ExpandRow(static_cast<std::int64_t>(x), y, oValid);
        }
        const std::size_t nFirstValid = FindByte(oValid, 0, 1);
        if (nFirstValid == nPixels)
        {
            return;
        }
        const unsigned char* const pIn = moIn.GetPixel(0, y) + x * mnPixelBytesIn;
        unsigned char* const pOut = moOut.GetPixel(0, y) + x * mnPixelBytesOut;
        if (NeedsNoCopies(nPixels))
        {
            mpfA = reinterpret_cast<const float*>(pIn);
            mpfOut = reinterpret_cast<float*>(pOut);
            Evaluate(oValid);
            return;
        }
        mpfA = mvfA.data();
        mpfOut = mvfOut.data();
        LoadOperands(pIn, nPixels);
        FillInvalid(oValid, nFirstValid);
        Evaluate(oValid);
        const bool bAllValid = nFirstValid == 0 && FindByte(oValid, 0, 0) == nPixels;
        if (bAllValid && moOut.mnChannels == 1)
        {
            Convert(pIn, nPixels, pOut);
        }
        else if (moOut.mnChannels != 0)
        {
            Convert(pIn, nPixels, mvStored.data());
            FindStore(moOut.moDataType.GetSampleBytes())(oValid, mvStored.data(), pOut,
                                                         mnPixelBytesOut);
        }
    }

    /// True where the blocks' own floats can be worked on: nothing is masked or padded.
    bool NeedsNoCopies(std::size_t nPixels) const
    {
        return moWork.mnIn == kFloat && moWork.mnOut == kFloat && !moWork.mbStoresInput &&
               moIn.mnChannels == 1 && moOut.mnChannels == 1 && mpoMask == nullptr &&
               moIn.mpBuffer != moOut.mpBuffer && nPixels % kernels::kAriPadding == 0;
    }

    /// The front of each pixel: the first nSamples channels.
    const unsigned char* Fronts(const unsigned char* pIn, std::size_t nSamples, std::size_t nPixels)
    {
        if (moIn.mnChannels == nSamples)
        {
            return pIn;
        }
        if (moIn.mnChannels > nSamples)
        {
            FindGather(nSamples * mnSampleBytesIn)(pIn, mnPixelBytesIn, nPixels, mvFronts.data());
        }
        return mvFronts.data();  // zeros where there are no channels at all
    }

    void LoadOperands(const unsigned char* pIn, std::size_t nPixels)
    {
        if (moIn.mnChannels == 1)
        {
            details::ConvertRow(moWork.mnIn, kFloat, pIn, mvfA.data(), nPixels);
            return;
        }
        details::ConvertRow(moWork.mnIn, kFloat, Fronts(pIn, 2, nPixels), mvfPairs.data(),
                            2 * nPixels);
        for (std::size_t i = 0; i < nPixels; ++i)
        {
            mvfA[i] = mvfPairs[2 * i];
            mvfB[i] = mvfPairs[2 * i + 1];
        }
    }

    /// Gives pixels that are masked, and those that pad the chunk, the operands of a valid one, so
    /// that they change no extreme.
    void FillInvalid(std::span<const unsigned char> oValid, std::size_t nFirstValid)
    {
        const float fA = mvfA[nFirstValid];
        const float fB = mvfB[nFirstValid];
        for (std::size_t i = 0; i < oValid.size() && mpoMask != nullptr; ++i)
        {
            mvfA[i] = oValid[i] != 0 ? mvfA[i] : fA;
            mvfB[i] = oValid[i] != 0 ? mvfB[i] : fB;
        }
        const auto nPadding = static_cast<std::ptrdiff_t>(PaddedSize(oValid) - oValid.size());
        const auto nEnd = static_cast<std::ptrdiff_t>(oValid.size());
        std::fill_n(mvfA.begin() + nEnd, nPadding, fA);
        std::fill_n(mvfB.begin() + nEnd, nPadding, fB);
    }

    void Evaluate(std::span<const unsigned char> oValid)
    {
        if (!moWork.meOperation)
        {
            RepeatValue(oValid);
            return;
        }
        const AriExtremes oFormer = moExtremes;
        kernels::EvaluateRow(moWork.moRow, mpfA, mvfB.data(), {mpfOut, PaddedSize(oValid)},
                             moExtremes);
        // Of zeros of both signs the first one is the extreme: whether +0 or -0 decides the order
        // of the pixels, which vectors do not keep.
        const bool bNewMin = moExtremes.mfMin == 0.0F && oFormer.mfMin != 0.0F;
        const bool bNewMax = moExtremes.mfMax == 0.0F && oFormer.mfMax != 0.0F;
        if (bNewMin || bNewMax)
        {
            const float fZero = FirstZero(oValid);
            moExtremes.mfMin = bNewMin ? fZero : moExtremes.mfMin;
            moExtremes.mfMax = bNewMax ? fZero : moExtremes.mfMax;
        }
    }

    /// The first result of the chunk that is a zero and counts.
    float FirstZero(std::span<const unsigned char> oValid) const
    {
        AriRow oRow = moWork.moRow;
        oRow.mbScales = false;
        oRow.mfZeroDivision = 1.0F;  // does not count
        AriExtremes oIgnored = moExtremes;
        std::vector<float> vfResults(PaddedSize(oValid));
        kernels::EvaluateRow(oRow, mpfA, mvfB.data(), vfResults, oIgnored);
        return *std::find(vfResults.begin(), vfResults.end(), 0.0F);
    }

    /// The results of an operator that is none: the former pixel's.
    void RepeatValue(std::span<const unsigned char> oValid)
    {
        const AriRow& oRow = moWork.moRow;
        for (std::size_t i = 0; i < oValid.size(); ++i)
        {
            if (oValid[i] != 0)
            {
                moExtremes.mfMax = mfValue > moExtremes.mfMax ? mfValue : moExtremes.mfMax;
                moExtremes.mfMin = moExtremes.mfMin > mfValue ? mfValue : moExtremes.mfMin;
                if (oRow.mbScales)
                {
                    mfValue = (mfValue - oRow.mfFrom) * oRow.mfFactor + oRow.mfLow;
                    mfValue = oRow.mfLow > mfValue ? oRow.mfLow : mfValue;
                    mfValue = mfValue > oRow.mfHigh ? oRow.mfHigh : mfValue;
                }
            }
            mpfOut[i] = mfValue;
        }
    }

    void Convert(const unsigned char* pIn, std::size_t nPixels, unsigned char* pOut)
    {
        if (moWork.mbStoresInput)
        {
            details::ConvertRow(moWork.mnIn, moWork.mnOut, Fronts(pIn, 1, nPixels), pOut, nPixels);
        }
        else
        {
            details::ConvertRow(kFloat, moWork.mnOut, mpfOut, pOut, nPixels);
        }
    }

    static std::size_t PaddedSize(std::span<const unsigned char> oValid)
    {
        return (oValid.size() + kernels::kAriPadding - 1) / kernels::kAriPadding *
               kernels::kAriPadding;
    }

    const AriWork& moWork;
    const Raster& moIn;
    const Mask* mpoMask;
    const Raster& moOut;
    std::size_t mnSampleBytesIn;
    std::size_t mnPixelBytesIn;
    std::size_t mnPixelBytesOut;
    AriExtremes moExtremes;
    float mfValue = 0.0F;
    std::vector<unsigned char> mvFronts;
    std::vector<unsigned char> mvStored;
    std::vector<unsigned char> mvValid;
    std::vector<float> mvfPairs;
    std::vector<float> mvfA;
    std::vector<float> mvfB;
    std::vector<float> mvfOut;
    const float* mpfA = nullptr;  ///< the operands and results of the chunk, in the vectors above
    float* mpfOut = nullptr;      ///< or in the blocks themselves
};

/// What all pairs of types share.
class AriProcessor : public IProcessor, public details::ARIParams, public details::ARIStats
{
public:
    void Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const override
    {
        RequireMatchingSizes(*poRasterIn, poMaskIn, *poRasterOut, nullptr, kSource);
        const AriWork oWork = WorkOn(*poRasterIn);
        AriBlock oBlock(oWork, *poRasterIn, poMaskIn, *poRasterOut, {GetARIMin(), GetARIMax()});
        oBlock.EvaluateAll();
        SetARIStats(oBlock.GetExtremes().mfMin, oBlock.GetExtremes().mfMax);
    }

protected:
    AriProcessor(std::size_t nIn, std::size_t nOut) : mnIn(nIn), mnOut(nOut) {}

private:
    AriWork WorkOn(const Raster& oIn) const
    {
        const unsigned int nScale = ElementOf(mvnAutoScale, 0);
        AriWork oWork;
        oWork.meOperation = OperationOf(ElementOf(mvnOper, 0), oIn.mnChannels != 1);
        oWork.mbStoresInput = nScale == 2;
        oWork.mnIn = mnIn;
        oWork.mnOut = mnOut;
        AriRow& oRow = oWork.moRow;
        oRow.meOperation = oWork.meOperation.value_or(AriOperation::eSum);
        oRow.mfConstant = ElementOf(mvfConst, 0);
        oRow.mfZeroDivision = ElementOf(mvfZeroDiv, 0);
        oRow.mbScales = nScale == 3;
        oRow.mfFrom = ElementOf(mvfRVal, 0);
        oRow.mfLow = ElementOf(mvfRVal, 2);
        oRow.mfHigh = ElementOf(mvfRVal, 3);
        const float fRange = ElementOf(mvfRVal, 1) - oRow.mfFrom;
        oRow.mfFactor = fRange > 0.0F ? (oRow.mfHigh - oRow.mfLow) / fRange : 1.0F;
        return oWork;
    }

    std::size_t mnIn;
    std::size_t mnOut;
};

}  // namespace

template <class TIn, class TOut>
class FilterARI::InnerProcessor : public AriProcessor
{
public:
    InnerProcessor()
        : AriProcessor(typedispatch::ElementPosition<TIn>(), typedispatch::ElementPosition<TOut>())
    {
    }
};

void FilterARI::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    RequireRasters(poRasterIn, poRasterOut, kSource);
    Require(!poRasterOut->moDataType.mbComplex, "Output cannot be complex for ARI",
            __PRETTY_FUNCTION__, __LINE__);

    const RealInput oInput(poRasterIn);
    const IProcessor& oProcessor = SelectProcessor<InnerProcessor, details::ARIParams>(
        oInput.Get()->moDataType, poRasterOut->moDataType, *this);
    oProcessor.Process(oInput.Get(), poMaskIn, poRasterOut);
    const auto& oStats = dynamic_cast<const details::ARIStats&>(oProcessor);
    SetARIStats(oStats.GetARIMin(), oStats.GetARIMax());
}

void ARIAlgorithm::SetValues(std::vector<unsigned int> vnOper, std::vector<float> vfConst,
                             std::vector<float> vfZeroDiv, std::vector<unsigned int> vnAutoScale,
                             std::vector<float> vfRVal)
{
    mpoFilter = std::make_shared<FilterARI>();
    mpoFilter->SetOper(std::move(vnOper));
    mpoFilter->SetConst(std::move(vfConst));
    mpoFilter->SetZeroDiv(std::move(vfZeroDiv));
    mpoFilter->SetAutoScale(std::move(vnAutoScale));
    mpoFilter->SetRVal(std::move(vfRVal));
}

void ARIAlgorithm::ProcessBlock(Raster* poRasterIn, Raster* poRasterOut) const
{
    Require(mpoFilter != nullptr, kNoValues, __PRETTY_FUNCTION__, __LINE__);
    std::unique_ptr<Mask> poMask;
    if (mpoMaskBuilder != nullptr && poRasterIn != nullptr)
    {
        poMask.reset(mpoMaskBuilder->BuildMask(*poRasterIn));
    }
    Process(poRasterIn, poMask.get(), poRasterOut);
}

void ARIAlgorithm::Process(Raster* poRasterIn, Mask* poMaskIn, Raster* poRasterOut) const
{
    Require(mpoFilter != nullptr, kNoValues, __PRETTY_FUNCTION__, __LINE__);
    mpoFilter->Process(poRasterIn, poMaskIn, poRasterOut);
}

float ARIAlgorithm::GetMinVal() const
{
    return mpoFilter != nullptr ? mpoFilter->GetARIMin() : FilterARI().GetARIMin();
}

float ARIAlgorithm::GetMaxVal() const
{
    return mpoFilter != nullptr ? mpoFilter->GetARIMax() : FilterARI().GetARIMax();
}

}  // namespace kor::filters
