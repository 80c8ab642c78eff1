#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <string>
#include <vector>

#include "tests/support/blocks.h"

/// The rules of sample conversion, written plainly a second time, and the samples on which both are
/// compared. Element types are named by their position in StandardTypeList, so that what loops over
/// the hundred pairs is compiled once.
namespace kor::test
{

constexpr std::size_t kElementTypes = 10;

tessel::DataType ElementType(std::size_t nType);
tessel::DataType ComplexElementType(std::size_t nType);

/// Samples of an element type that is known at run time, all bytes 0xA5 at first.
class Elements
{
public:
    Elements(std::size_t nType, std::size_t nCount)
        : mnType(nType),
          mnCount(nCount),
          mvBytes(nCount * ElementType(nType).GetSampleBytes(), 0xA5)
    {
    }

    std::size_t Type() const { return mnType; }
    std::size_t Size() const { return mnCount; }
    const unsigned char* Data() const { return mvBytes.data(); }
    unsigned char* Data() { return mvBytes.data(); }

private:
    std::size_t mnType;
    std::size_t mnCount;
    std::vector<unsigned char> mvBytes;
};

using Row = void (*)(const void* pIn, void* pOut, std::size_t nCount);

/// nCount samples converted one by one.
Row ReferenceConversion(std::size_t nIn, std::size_t nOut);
/// nCount sums of squares of nCount pairs.
Row ReferenceIntensity(std::size_t nIn, std::size_t nOut);

/// One sample converted.
template <class TIn, class TOut>
TOut ReferenceSample(TIn xIn)
{
    TOut xOut{};
    ReferenceConversion(typedispatch::ElementPosition<TIn>(),
                        typedispatch::ElementPosition<TOut>())(&xIn, &xOut, 1);
    return xOut;
}

/// nCount elements of type nOut that a row function makes of oIn.
Elements Converted(Row pfnRow, const Elements& oIn, std::size_t nOut, std::size_t nCount);

/// Samples around every limit of a conversion, and as many random ones of all magnitudes.
Elements ConversionSamples(std::size_t nType, Random& oRandom);

/// Bit by bit; all NaNs count as equal.
::testing::AssertionResult SameElements(const Elements& oActual, const Elements& oExpected);

/// Calls oVisit(nIn, nOut) for each of the hundred pairs of element types.
template <class Visit>
void ForEachTypePair(const Visit& oVisit)
{
    for (std::size_t i = 0; i < kElementTypes * kElementTypes; ++i)
    {
        oVisit(i / kElementTypes, i % kElementTypes);
    }
}

}  // namespace kor::test
