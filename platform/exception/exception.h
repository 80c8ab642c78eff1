#pragma once

#include <exception>
#include <string>

namespace kor
{

/// Base of all errors of the library: a message, and where it was raised.
///
/// Messages that are translated for the user carry no source: file and function are empty and the
/// line is 0.
class Exception : public std::exception
{
public:
    Exception(std::string oMessage, std::string oFile, std::string oFunction, unsigned int nLine);

    const std::string& GetMessage() const { return moMessage; }
    /// Source path without extension, such as "basic/tessel/raster/raster".
    const std::string& GetFile() const { return moFile; }
    /// Full signature of the function that threw.
    const std::string& GetFunction() const { return moFunction; }
    unsigned int GetLine() const { return mnLine; }

    /// The message.
    const char* what() const noexcept override;

private:
    std::string moMessage;
    std::string moFile;
    std::string moFunction;
    unsigned int mnLine;
};

/// Data that an image object or a dataset cannot be made of.
class DataException : public Exception
{
public:
    using Exception::Exception;
};

/// A parameter with a value that cannot be used, or a block that does not fit the parameters.
class ParameterException : public DataException
{
public:
    /// What kind of error it is; the library raises eInvalidValue alone.
    enum class Type : int
    {
        eUnknown = 0,
        eInvalidValue = 1
    };

    /// oFirstText and oSecondText are free words: the value that was given and what is allowed.
    ParameterException(std::string oParameterName, Type eType, std::string oFirstText,
                       std::string oSecondText, std::string oMessage, std::string oFile,
                       std::string oFunction, unsigned int nLine);

    /// The parameter as the caller wrote it.
    const std::string& GetParameterName() const { return moParameterName; }
    Type GetType() const { return meType; }
    const std::string& GetFirstText() const { return moFirstText; }
    const std::string& GetSecondText() const { return moSecondText; }

    /// The message, or where that is empty the first text behind the parameter name.
    const char* what() const noexcept override;

private:
    std::string moParameterName;
    Type meType;
    std::string moFirstText;
    std::string moSecondText;
    std::string moWhat;
};

/// Reading or writing failed.
class IOException : public Exception
{
public:
    using Exception::Exception;
};

/// A file is missing, exists already, or is not what it should be.
class FileException : public IOException
{
public:
    FileException(std::string oMessage, std::string oFileName, std::string oFile,
                  std::string oFunction, unsigned int nLine);

    /// The file that the error is about.
    const std::string& GetFileName() const { return moFileName; }

private:
    std::string moFileName;
};

}  // namespace kor
