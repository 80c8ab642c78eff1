#include "platform/tessel/complexinterpretation.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <memory>
#include <string>
#include <utility>

#include "platform/exception/exception.h"
#include "tests/support/blocks.h"

namespace kor::tessel
{
namespace
{

using test::BlankRaster;
using test::Margins;

std::unique_ptr<Raster> Interpreted(const Raster& oRaster, KORInterpretationTypes eType)
{
    return std::unique_ptr<Raster>(ComplexInterpretation().InterpretRaster(&oRaster, eType));
}

/// One pixel of one channel.
template <class T>
std::unique_ptr<Raster> ComplexPixel(T re, T im)
{
    auto poRaster = BlankRaster(1, 1, 1, typedispatch::ComplexDataType<T>());
    poRaster->template GetPixelAs<T>(0, 0)[0] = re;
    poRaster->template GetPixelAs<T>(0, 0)[1] = im;
    return poRaster;
}

TEST(ComplexInterpretation, KnowsSixQuantities)
{
    const auto poPixel = ComplexPixel<double>(-3, 4);
    const auto oValue = [&](KORInterpretationTypes eType)
    { return *Interpreted(*poPixel, eType)->GetPixelAs<double>(0, 0); };
    EXPECT_EQ(oValue(eKIT_Magnitude), 5.0);
    EXPECT_EQ(oValue(eKIT_Intensity), 25.0);
    EXPECT_DOUBLE_EQ(oValue(eKIT_Phase), std::atan2(4.0, -3.0));
    EXPECT_EQ(oValue(eKIT_Real), -3.0);
    EXPECT_EQ(oValue(eKIT_Imaginary), 4.0);
    EXPECT_DOUBLE_EQ(oValue(eKIT_IntensityDb), 10.0 * std::log10(25.0));
}

TEST(ComplexInterpretation, GivesTheMagnitudeForNumberZero)
{
    EXPECT_EQ(static_cast<int>(eKIT_Magnitude), 0);
    const auto poPixel = ComplexPixel<float>(3, 4);
    EXPECT_EQ(
        *Interpreted(*poPixel, static_cast<KORInterpretationTypes>(0))->GetPixelAs<float>(0, 0),
        5.0F);
}

TEST(ComplexInterpretation, GivesMinusInfinityDecibelForNoIntensity)
{
    const auto poPixel = ComplexPixel<double>(0, 0);
    EXPECT_EQ(*Interpreted(*poPixel, eKIT_IntensityDb)->GetPixelAs<double>(0, 0),
              -std::numeric_limits<double>::infinity());
}

TEST(ComplexInterpretation, WidensToTheTypeThatHoldsTheParts)
{
    const std::pair<DataType, DataType> aoTypes[] = {
        {DataType(8, true, false, 8, 0, true), eDT_32R},
        {DataType(8, false, false, 8, 0, true), eDT_32R},
        {eDT_C16U, eDT_32R},
        {eDT_C16S, eDT_32R},
        {eDT_C32U, eDT_64R},
        {eDT_C32S, eDT_64R},
        {eDT_C32R, eDT_32R},
        {eDT_C64R, eDT_64R},
        {DataType(64, true, false, 64, 0, true), eDT_64R},
        {DataType(64, false, false, 64, 0, true), eDT_64R}};
    for (const auto& [oType, oExpected] : aoTypes)
    {
        EXPECT_EQ(Interpreted(*BlankRaster(1, 1, 1, oType), eKIT_Magnitude)->moDataType, oExpected);
    }
}

TEST(ComplexInterpretation, ReadsPartsWithTheirSign)
{
    const auto poChar = ComplexPixel<char>(-5, 12);
    EXPECT_EQ(*Interpreted(*poChar, eKIT_Real)->GetPixelAs<float>(0, 0), -5.0F);
    EXPECT_EQ(*Interpreted(*poChar, eKIT_Magnitude)->GetPixelAs<float>(0, 0), 13.0F);
    const auto poUnsigned = ComplexPixel<unsigned int>(4294967295U, 0);
    EXPECT_EQ(*Interpreted(*poUnsigned, eKIT_Real)->GetPixelAs<double>(0, 0), 4294967295.0);
}

TEST(ComplexInterpretation, KeepsTheGeometryAndFillsMarginsAndChannels)
{
    const auto poRaster = BlankRaster(2, 1, 2, eDT_C16S, Margins{1, 2});
    poRaster->mnOffsetX = 70;
    poRaster->mnOffsetY = 80;
    auto* pParts = reinterpret_cast<short*>(poRaster->mpBuffer);
    for (short i = 0; i < 4 * 5 * 2; ++i)
    {
        pParts[2 * i] = static_cast<short>(3 * i);
        pParts[2 * i + 1] = static_cast<short>(-4 * i);
    }
    const auto poOut = Interpreted(*poRaster, eKIT_Magnitude);
    EXPECT_EQ(poOut->mnWidth, 2U);
    EXPECT_EQ(poOut->mnHeight, 1U);
    EXPECT_EQ(poOut->mnChannels, 2U);
    EXPECT_EQ(poOut->mnMarginX, 1U);
    EXPECT_EQ(poOut->mnMarginY, 2U);
    EXPECT_EQ(poOut->mnOffsetX, 70U);
    EXPECT_EQ(poOut->mnOffsetY, 80U);
    EXPECT_TRUE(poOut->mbOwnsBuffer);
    const auto* pOut = reinterpret_cast<const float*>(poOut->mpBuffer);
    for (int i = 0; i < 4 * 5 * 2; ++i)
    {
        EXPECT_EQ(pOut[i], 5.0F * static_cast<float>(i));
    }
}

void ExpectRefused(const Raster* poRaster, KORInterpretationTypes eType,
                   const std::string& oMessage)
{
    try
    {
        const std::unique_ptr<Raster> poOut(
            ComplexInterpretation().InterpretRaster(poRaster, eType));
        ADD_FAILURE() << "a raster was made";
    }
    catch (const DataException& oError)
    {
        EXPECT_EQ(oError.GetMessage(), oMessage);
    }
}

TEST(ComplexInterpretation, RefusesWhatIsNotComplex)
{
    const auto poComplex = ComplexPixel<float>(3, 4);
    ExpectRefused(nullptr, eKIT_Magnitude, "poRaster is NULL, there is nothing to interpret");
    ExpectRefused(BlankRaster(1, 1, 1, eDT_32R).get(), eKIT_Magnitude,
                  "The raster to interpret is not complex");
    ExpectRefused(BlankRaster(1, 1, 1, DataType(1, false, false, 1, 0, true)).get(), eKIT_Magnitude,
                  "The parts of the complex raster have no known data type");
    ExpectRefused(poComplex.get(), static_cast<KORInterpretationTypes>(6),
                  "There is no complex interpretation 6");
    ExpectRefused(poComplex.get(), static_cast<KORInterpretationTypes>(-1),
                  "There is no complex interpretation -1");
}

}  // namespace
}  // namespace kor::tessel
