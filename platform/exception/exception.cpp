#include "platform/exception/exception.h"

#include <utility>

namespace kor
{

Exception::Exception(std::string oMessage, std::string oFile, std::string oFunction,
                     unsigned int nLine)
    : moMessage(std::move(oMessage)),
      moFile(std::move(oFile)),
      moFunction(std::move(oFunction)),
      mnLine(nLine)
{
}

const char* Exception::what() const noexcept
{
    return moMessage.c_str();
}

ParameterException::ParameterException(std::string oParameterName, Type eType,
                                       std::string oFirstText, std::string oSecondText,
                                       std::string oMessage, std::string oFile,
                                       std::string oFunction, unsigned int nLine)
    : DataException(std::move(oMessage), std::move(oFile), std::move(oFunction), nLine),
      moParameterName(std::move(oParameterName)),
      meType(eType),
      moFirstText(std::move(oFirstText)),
      moSecondText(std::move(oSecondText)),
      moWhat(GetMessage())
{
    if (moWhat.empty())
    {
        moWhat = moParameterName.empty() ? moFirstText : moParameterName + ": " + moFirstText;
    }
}

const char* ParameterException::what() const noexcept
{
    return moWhat.c_str();
}

FileException::FileException(std::string oMessage, std::string oFileName, std::string oFile,
                             std::string oFunction, unsigned int nLine)
    : IOException(std::move(oMessage), std::move(oFile), std::move(oFunction), nLine),
      moFileName(std::move(oFileName))
{
}

}  // namespace kor
