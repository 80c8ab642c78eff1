#include "platform/exception/exception.h"

#include <gtest/gtest.h>

#include <type_traits>

namespace kor
{
namespace
{

ParameterException MarginError(const std::string& oFirstText, const std::string& oMessage)
{
    return ParameterException("poRasterIn", ParameterException::Type::eInvalidValue, oFirstText,
                              "second", oMessage, "file", "function", 7);
}

TEST(Exception, KeepsMessageAndSource)
{
    const Exception oError("message", "file", "function", 12);
    EXPECT_EQ(oError.GetMessage(), "message");
    EXPECT_EQ(oError.GetFile(), "file");
    EXPECT_EQ(oError.GetFunction(), "function");
    EXPECT_EQ(oError.GetLine(), 12U);
    EXPECT_STREQ(oError.what(), "message");
}

TEST(Exception, IsTheBaseOfTheOthers)
{
    EXPECT_TRUE((std::is_base_of_v<std::exception, Exception>));
    EXPECT_TRUE((std::is_base_of_v<Exception, DataException>));
    EXPECT_TRUE((std::is_base_of_v<DataException, ParameterException>));
    EXPECT_TRUE((std::is_base_of_v<Exception, IOException>));
    EXPECT_TRUE((std::is_base_of_v<IOException, FileException>));
    EXPECT_FALSE((std::is_base_of_v<DataException, IOException>));
}

TEST(Exception, IsCaughtByItsBase)
{
    try
    {
        throw DataException("message", "file", "function", 12);
    }
    catch (const std::exception& oError)
    {
        EXPECT_STREQ(oError.what(), "message");
    }
}

TEST(ParameterException, KeepsItsParameterAndItsTexts)
{
    const ParameterException oError = MarginError("first", "message");
    EXPECT_EQ(oError.GetParameterName(), "poRasterIn");
    EXPECT_EQ(oError.GetType(), ParameterException::Type::eInvalidValue);
    EXPECT_EQ(static_cast<int>(oError.GetType()), 1);
    EXPECT_EQ(oError.GetFirstText(), "first");
    EXPECT_EQ(oError.GetSecondText(), "second");
    EXPECT_EQ(oError.GetMessage(), "message");
    EXPECT_EQ(oError.GetFile(), "file");
    EXPECT_EQ(oError.GetFunction(), "function");
    EXPECT_EQ(oError.GetLine(), 7U);
}

TEST(ParameterException, TellsItsMessageOrElseItsFirstTextBehindTheParameter)
{
    EXPECT_STREQ(MarginError("first", "message").what(), "message");
    EXPECT_STREQ(MarginError("first", "").what(), "poRasterIn: first");
    const ParameterException oNameless("", ParameterException::Type::eInvalidValue, "first", "", "",
                                       "", "", 0);
    EXPECT_STREQ(oNameless.what(), "first");
}

TEST(FileException, KeepsTheFileItIsAbout)
{
    const FileException oError("message", "image.dsk", "file", "function", 9);
    EXPECT_EQ(oError.GetMessage(), "message");
    EXPECT_EQ(oError.GetFileName(), "image.dsk");
    EXPECT_EQ(oError.GetFile(), "file");
    EXPECT_EQ(oError.GetFunction(), "function");
    EXPECT_EQ(oError.GetLine(), 9U);
    EXPECT_STREQ(oError.what(), "message");
}

TEST(IOException, KeepsMessageAndSource)
{
    const IOException oError("message", "file", "function", 3);
    EXPECT_EQ(oError.GetMessage(), "message");
    EXPECT_EQ(oError.GetLine(), 3U);
}

}  // namespace
}  // namespace kor
