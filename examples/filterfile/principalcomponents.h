#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "examples/filterfile/arguments.h"
#include "examples/filterfile/filtertable.h"
#include "platform/datasources/auxiliarydata.h"
#include "processes/qrdfilters/filterpca.h"

namespace kor::examples
{

/// The principal components of an image: its statistics and what they say about the transform. In
/// whole numbers the mean of a component is stored as the middle of the type's range, and a number
/// of its standard deviations reaches from there to the ends; floating point is not scaled.
class PrincipalComponents
{
public:
    /// What the command line says about them, one parameter a line.
    static constexpr const char* kParameters =
        "components=    how many are written, from the strongest; else as many as channels\n"
        "deviations=3   standard deviations from the middle to the ends of whole numbers; 32R and\n"
        "               64R are not scaled\n"
        "window=        x,y,width,height: pixels that the statistics are made of; else all\n"
        "bitmap=        number of a bitmap of IN that selects them\n";

    PrincipalComponents(Arguments& oArguments, std::size_t nChannels);

    std::size_t GetCount() const { return mvnComponents.size(); }
    /// Reads the image. Throws std::runtime_error when the sample is empty.
    void Analyse(const SourceImage& oImage, const tessel::DataType& oOut);
    filters::FilterPCA GetFilter() const;
    /// "SHORT" or "LONG". The extremes are those of what has been transformed by now.
    void Print(const char* pszMode) const;
    /// A name for each channel of the result.
    datasources::AuxiliaryData Describe() const;

private:
    void TakeWindow(Arguments& oArguments);
    void ChooseScaling(const tessel::DataType& oOut);

    std::vector<unsigned int> mvnComponents;
    float mfDeviations = 0;
    std::vector<unsigned int> mvnWindow;
    int mnBitmap = 0;
    std::optional<filters::PCAStatistics> moStatistics;
    std::vector<float> mvfCovariance, mvfMeans, mvfDeviations;
    std::vector<float> mvfVectors, mvfValues, mvfValueDeviations, mvfVariance;
    std::vector<float> mvfRange, mvfMidPoint, mvfScale;
};

}  // namespace kor::examples
