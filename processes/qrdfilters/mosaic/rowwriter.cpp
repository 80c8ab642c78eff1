#include "processes/qrdfilters/mosaic/rowwriter.h"

#include <algorithm>
#include <limits>

#include "processes/qrdfilters/findbyte.h"
#include "processes/qrdfilters/samplerows.h"

namespace kor::filters
{

namespace
{

// Samples that are worked on together: all that belongs to them stays in the nearest cache.
constexpr std::size_t kPartSamples = 1024;

constexpr std::size_t kFloat = typedispatch::ElementPosition<float>();
constexpr std::size_t kDouble = typedispatch::ElementPosition<double>();

// What becomes of an output sample.
constexpr unsigned char kKeep = 0;
constexpr unsigned char kReplace = 1;
constexpr unsigned char kBlend = 2;

/// Bends what lies on the knee.
double Bend(double t, const SoftKnee& oKnee)
{
    const double dfAbove = t - oKnee.mdfLow;
    const double dfBent = dfAbove * dfAbove / (oKnee.mdfHigh - oKnee.mdfLow) + oKnee.mdfLow;
    return t > oKnee.mdfStart && t < oKnee.mdfHigh ? dfBent : t;
}

}  // namespace

RowWriter::RowWriter(const WriteRules& oRules, std::size_t nIn, std::size_t nOut,
                     const tessel::Raster& oIn, const tessel::Raster& oOut)
    : moRules(oRules),
      moIn(oIn),
      moOut(oOut),
      mnIn(nIn),
      mnOut(nOut),
      mnChannels(oIn.mnChannels),
      mnElementBytesOut(oOut.moDataType.GetSampleBytes())
{
}

void RowWriter::WriteRow(std::uint32_t y, std::span<const std::uint32_t> oDistances)
{
    const std::size_t nPartPixels =
        std::max<std::size_t>(1, kPartSamples / std::max<std::size_t>(1, mnChannels));
    for (std::size_t x = 0; x < oDistances.size(); x += nPartPixels)
    {
        const std::size_t nPixels = std::min(nPartPixels, oDistances.size() - x);
        const auto nColumn = static_cast<std::int64_t>(x);
        WritePart(moIn.GetPixel(nColumn, y), moOut.GetPixel(nColumn, y),
                  oDistances.subspan(x, nPixels));
    }
}

void RowWriter::WritePart(const unsigned char* pIn, unsigned char* pOut,
                          std::span<const std::uint32_t> oDistances)
{
    const std::size_t nSamples = oDistances.size() * mnChannels;
    mvdfIn.resize(nSamples);
    mvfNew.resize(nSamples);
    mvfOther.resize(nSamples);
    mvnFates.resize(nSamples);

    FindFates(pIn, oDistances);
    Balance(pIn);
    if (FindByte(mvnFates, 0, kBlend) != nSamples)
    {
        Blend(pOut, oDistances);
    }
    Store(pOut);
    if (moRules.mfOutputNoData)
    {
        MoveOffNoData(pOut);
    }
}

/// By the distance, and by the input's "no data".
void RowWriter::FindFates(const unsigned char* pIn, std::span<const std::uint32_t> oDistances)
{
    const auto oFate = [nWidth = std::int64_t{moRules.mnBlendWidth}](std::int64_t d) {
        return d == 0 ? kReplace : d < nWidth ? kBlend : kKeep;
    };
    if (mnChannels == 1)
    {
        std::transform(oDistances.begin(), oDistances.end(), mvnFates.begin(), oFate);
    }
    else
    {
        auto itFate = mvnFates.begin();
        for (const std::uint32_t d : oDistances)
        {
            itFate = std::fill_n(itFate, mnChannels, oFate(d));
        }
    }
    if (moRules.mfInputNoData)
    {
        const float fNoData = *moRules.mfInputNoData;
        details::ConvertRow(mnIn, kFloat, pIn, mvfOther.data(), mvfOther.size());
        std::transform(mvnFates.begin(), mvnFates.end(), mvfOther.begin(), mvnFates.begin(),
                       [fNoData](unsigned char nFate, float fIn)
                       { return fIn == fNoData ? kKeep : nFate; });
    }
}

/// The new samples, as they are inside the valid area.
void RowWriter::Balance(const unsigned char* pIn)
{
    const auto [dfGain, dfOffset] = moRules.moLine;
    details::ConvertRow(mnIn, kDouble, pIn, mvdfIn.data(), mvdfIn.size());
    std::transform(mvdfIn.begin(), mvdfIn.end(), mvdfIn.begin(),
                   [dfGain = dfGain, dfOffset = dfOffset](double x)
                   { return x * dfGain + dfOffset; });
    if (moRules.moKnee)
    {
        std::transform(mvdfIn.begin(), mvdfIn.end(), mvdfIn.begin(),
                       [oKnee = *moRules.moKnee](double t) { return Bend(t, oKnee); });
    }
    std::transform(mvdfIn.begin(), mvdfIn.end(), mvfNew.begin(),
                   [](double t) { return static_cast<float>(t); });
}

/// Mixes new and old in the feathering band, where the old sample is not "no data".
void RowWriter::Blend(const unsigned char* pOut, std::span<const std::uint32_t> oDistances)
{
    const int nWidth = moRules.mnBlendWidth;
    details::ConvertRow(mnOut, kFloat, pOut, mvfOther.data(), mvfOther.size());
    for (std::size_t i = 0; i < mvnFates.size(); ++i)
    {
        if (mvnFates[i] == kBlend)
        {
            const float fOld = mvfOther[i];
            const auto d = static_cast<int>(oDistances[i / mnChannels]);
            mvfNew[i] =
                (static_cast<float>(nWidth - d) * mvfNew[i] + static_cast<float>(d) * fOld) /
                static_cast<float>(nWidth);
            mvnFates[i] =
                moRules.mfOutputNoData && fOld == *moRules.mfOutputNoData ? kKeep : kReplace;
        }
    }
}

/// Stores the samples that are to be replaced, run by run.
void RowWriter::Store(unsigned char* pOut) const
{
    for (std::size_t i = FindByte(mvnFates, 0, kReplace); i < mvnFates.size();)
    {
        const std::size_t nEnd = FindByte(mvnFates, i, kKeep);
        details::ConvertRow(kFloat, mnOut, &mvfNew[i], pOut + i * mnElementBytesOut, nEnd - i);
        i = FindByte(mvnFates, nEnd, kReplace);
    }
}

/// Moves each value that now reads as "no data" by 1 and stores it again.
void RowWriter::MoveOffNoData(unsigned char* pOut)
{
    const float fNoData = *moRules.mfOutputNoData;
    const float fStep = fNoData == std::numeric_limits<float>::max() ? -1.0F : 1.0F;
    details::ConvertRow(mnOut, kFloat, pOut, mvfOther.data(), mvfOther.size());
    for (std::size_t i = 0; i < mvnFates.size(); ++i)
    {
        const bool bMoves = mvnFates[i] == kReplace && mvfOther[i] == fNoData;
        mvfNew[i] = bMoves ? mvfNew[i] + fStep : mvfNew[i];
        mvnFates[i] = bMoves ? kReplace : kKeep;
    }
    Store(pOut);
}

}  // namespace kor::filters
