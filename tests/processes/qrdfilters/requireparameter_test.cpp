#include "processes/qrdfilters/requireparameter.h"

#include <gtest/gtest.h>

#include <source_location>
#include <string>

#include "platform/exception/exception.h"

namespace kor::filters
{
namespace
{

TEST(RequireParameter, ThrowsWithTheParameterAndThePlaceOfTheCall)
{
    unsigned int nLine = 0;
    try
    {
        nLine = std::source_location::current().line() + 1;
        RequireParameter(false, "mnSide", "The side is odd", "processes/qrdfilters/filterof");
        FAIL() << "nothing was thrown";
    }
    catch (const ParameterException& oException)
    {
        EXPECT_EQ(oException.GetMessage(), "The side is odd");
        EXPECT_EQ(oException.GetParameterName(), "mnSide");
        EXPECT_EQ(oException.GetType(), ParameterException::Type::eInvalidValue);
        EXPECT_EQ(oException.GetFirstText(), "");
        EXPECT_EQ(oException.GetSecondText(), "");
        EXPECT_EQ(oException.GetFile(), "processes/qrdfilters/filterof");
        EXPECT_NE(oException.GetFunction().find("TestBody"), std::string::npos);
        EXPECT_EQ(oException.GetLine(), nLine);
    }
}

TEST(RequireParameter, IsContentWithWhatHolds)
{
    EXPECT_NO_THROW(RequireParameter(true, "mnSide", "The side is odd", ""));
}

}  // namespace
}  // namespace kor::filters
