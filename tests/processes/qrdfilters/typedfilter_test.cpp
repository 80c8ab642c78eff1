#include "processes/qrdfilters/typedfilter.h"

#include <gtest/gtest.h>

#include <string>

#include "platform/exception/exception.h"
#include "processes/qrdfilters/iprocessor.h"
#include "tests/support/blocks.h"

namespace kor::filters
{
namespace
{

using namespace kor::test;
using tessel::eDT_16S;
using tessel::eDT_32R;
using tessel::eDT_8U;

constexpr const char* kSource = "processes/qrdfilters/filterexample";

/// Runs oCall and gives the kor::Exception that it throws.
template <class Call>
Exception ThrownBy(const Call& oCall)
{
    try
    {
        oCall();
    }
    catch (const Exception& oException)
    {
        return oException;
    }
    ADD_FAILURE() << "threw nothing";
    return Exception("", "", "", 0);
}

TEST(RequireRasters, AcceptsTwoRasters)
{
    const auto poRaster = BlankRaster(1, 1, 1, eDT_8U);
    EXPECT_NO_THROW(RequireRasters(poRaster.get(), poRaster.get(), kSource));
}

TEST(RequireRasters, ReportsTheInputBeforeTheOutput)
{
    const Exception oException = ThrownBy([] { RequireRasters(nullptr, nullptr, kSource); });
    EXPECT_EQ(oException.GetMessage(), "poRasterIn is invalid pointer");
}

TEST(RequireRasters, ReportsTheOutput)
{
    const auto poRaster = BlankRaster(1, 1, 1, eDT_8U);
    const Exception oException =
        ThrownBy([&] { RequireRasters(poRaster.get(), nullptr, kSource); });
    EXPECT_EQ(oException.GetMessage(), "poRasterOut is invalid pointer");
}

void CallFromHere(unsigned int& nLine)
{
    nLine = __LINE__ + 1;
    RequireRasters(nullptr, nullptr, kSource);
}

TEST(RequireRasters, NamesTheFunctionThatCalledIt)
{
    unsigned int nLine = 0;
    const Exception oException = ThrownBy([&] { CallFromHere(nLine); });
    EXPECT_EQ(oException.GetFile(), kSource);
    EXPECT_NE(oException.GetFunction().find("CallFromHere(unsigned int&)"), std::string::npos)
        << oException.GetFunction();
    EXPECT_EQ(oException.GetLine(), nLine);
}

TEST(RequireRealOutput, ReportsAComplexOutputAlone)
{
    EXPECT_NO_THROW(RequireRealOutput(*BlankRaster(1, 1, 1, eDT_32R), kSource));
    const auto poComplex = BlankRaster(1, 1, 1, tessel::eDT_C32R);
    const Exception oException = ThrownBy([&] { RequireRealOutput(*poComplex, kSource); });
    EXPECT_EQ(oException.GetMessage(), "Output cannot be complex");
    EXPECT_EQ(oException.GetFile(), kSource);
}

TEST(RealInput, LeavesARealRasterAlone)
{
    const auto poRaster = BlankRaster(2, 1, 1, eDT_16S);
    EXPECT_EQ(RealInput(poRaster.get()).Get(), poRaster.get());
}

TEST(RealInput, SeesAComplexRasterAsItsMagnitude)
{
    const auto poRaster = BlankRaster(2, 1, 1, tessel::eDT_C16S, Margins{1, 0});
    const short anSamples[] = {0, 0, 3, 4, -5, 12, 0, -7};
    std::copy_n(anSamples, 8, reinterpret_cast<short*>(poRaster->mpBuffer));
    const RealInput oInput(poRaster.get());
    EXPECT_EQ(ImageOf<float>(*oInput.Get()), (Image<float>{{5, 13}}));
    EXPECT_EQ(oInput.Get()->mnMarginX, 1U);
    EXPECT_EQ(*oInput.Get()->GetPixelAs<float>(2, 0), 7.0F);
}

class ExampleParams
{
public:
    virtual ~ExampleParams() = default;
    ExampleParams() = default;
    ExampleParams(const ExampleParams&) = default;
    ExampleParams& operator=(const ExampleParams& oOther)
    {
        if (oOther.mnValue < 0)
        {
            throw Exception("the value is negative", kSource, "operator=", 1);
        }
        mnValue = oOther.mnValue;
        return *this;
    }

    int mnValue = 0;
};

class ExampleProcessor : public IProcessor, public ExampleParams
{
public:
    ~ExampleProcessor() override { --snAlive; }
    ExampleProcessor() { ++snAlive; }
    ExampleProcessor(const ExampleProcessor&) = delete;
    ExampleProcessor& operator=(const ExampleProcessor&) = delete;
    void Process(tessel::Raster*, tessel::Mask*, tessel::Raster*) const override {}

    static int snAlive;
};

int ExampleProcessor::snAlive = 0;

/// A typed filter whose processors can be seen.
class ExampleFilter : public ExampleParams, private ProcessorCache<IProcessor>
{
public:
    /// The value of the processor that works on the two types.
    int Value(const tessel::DataType& oIn, const tessel::DataType& oOut) const
    {
        const auto oMake = [](const tessel::DataType&, const tessel::DataType& oMakeOut)
        {
            if (oMakeOut.mbComplex)
            {
                throw Exception("no such type", kSource, "oMake", 1);
            }
            return new ExampleProcessor();
        };
        const IProcessor& oProcessor = SelectProcessor<ExampleParams>(oIn, oOut, *this, oMake);
        return dynamic_cast<const ExampleProcessor&>(oProcessor).mnValue;
    }
    bool HasProcessor() const { return mpoProcessor != nullptr; }
    tessel::DataType OutputType() const { return moOutputType; }
};

TEST(ProcessorCache, StartsEmpty)
{
    const ExampleFilter oFilter;
    EXPECT_FALSE(oFilter.HasProcessor());
    EXPECT_EQ(oFilter.OutputType(), tessel::DataType());
}

TEST(ProcessorCache, KeepsTheProcessorWhileBothTypesStay)
{
    ExampleFilter oFilter;
    oFilter.mnValue = 1;
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 1);
    oFilter.mnValue = 2;
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 1);
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_32R), 2);
    oFilter.mnValue = 3;
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_32R), 2);
    EXPECT_EQ(oFilter.Value(eDT_16S, eDT_32R), 3);
    EXPECT_EQ(ExampleProcessor::snAlive, 1);
}

TEST(ProcessorCache, DropsTheProcessorWhenAnotherOneCannotBeMade)
{
    ExampleFilter oFilter;
    oFilter.mnValue = 1;
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 1);
    EXPECT_THROW(oFilter.Value(eDT_8U, tessel::eDT_C32R), Exception);
    EXPECT_FALSE(oFilter.HasProcessor());
    EXPECT_EQ(oFilter.OutputType(), tessel::eDT_C32R);
    EXPECT_THROW(oFilter.Value(eDT_8U, tessel::eDT_C32R), Exception);
    oFilter.mnValue = 2;
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 2);
}

TEST(ProcessorCache, DoesNotKeepAProcessorThatRefusesItsParameters)
{
    ExampleFilter oFilter;
    oFilter.mnValue = -1;
    EXPECT_THROW(oFilter.Value(eDT_8U, eDT_8U), Exception);
    EXPECT_THROW(oFilter.Value(eDT_8U, eDT_8U), Exception);
    EXPECT_EQ(ExampleProcessor::snAlive, 0);
    oFilter.mnValue = 4;
    EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 4);
}

TEST(ProcessorCache, IsSharedByCopiesAndFreedOnce)
{
    {
        ExampleFilter oFilter;
        oFilter.mnValue = 1;
        EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 1);
        ExampleFilter oCopy(oFilter);
        ExampleFilter oAssigned;
        oAssigned = oFilter;
        EXPECT_EQ(ExampleProcessor::snAlive, 1);
        oCopy.mnValue = oAssigned.mnValue = 2;
        EXPECT_EQ(oCopy.Value(eDT_8U, eDT_8U), 1);
        EXPECT_EQ(oAssigned.Value(eDT_8U, eDT_8U), 1);
        // A copy that moves on to other types leaves the original its processor.
        EXPECT_EQ(oCopy.Value(eDT_8U, eDT_32R), 2);
        EXPECT_EQ(ExampleProcessor::snAlive, 2);
        EXPECT_EQ(oFilter.Value(eDT_8U, eDT_8U), 1);
    }
    EXPECT_EQ(ExampleProcessor::snAlive, 0);
}

}  // namespace
}  // namespace kor::filters
