#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <new>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/exception/exception.h"
#include "processes/qrdfilters/filterhom.h"
#include "processes/qrdfilters/statistics/checkedvector.h"
#include "processes/qrdfilters/statistics/valuecounts.h"

namespace kor::filters
{

using tessel::DataType;
using tessel::Raster;

namespace
{

constexpr std::size_t kOutside = std::numeric_limits<std::size_t>::max();

/// Entries that a table has for samples of a type.
std::size_t TableSize(const DataType& oType)
{
    if (oType == tessel::eDT_8U)
    {
        return 256;
    }
    return oType == tessel::eDT_16S ? 32767 : 65536;
}

/// A sample as an index: floating point is cut, integers are taken as 16-bit unsigned numbers.
template <class T>
std::size_t IndexOf(T x)
{
    if constexpr (std::is_floating_point_v<T>)
    {
        const bool bHeld = x > T(-1) && x < T(65536);
        return bHeld ? static_cast<std::size_t>(x) : kOutside;
    }
    else
    {
        return static_cast<std::uint16_t>(x);
    }
}

int CutToInt(double df)
{
    constexpr double kLowest = std::numeric_limits<int>::min();
    constexpr double kHighest = std::numeric_limits<int>::max();
    return std::isnan(df) ? 0 : static_cast<int>(std::clamp(df, kLowest, kHighest));
}

/// The table in the making: takes pixels, then gives a value for each class.
class Means
{
public:
    Means(std::size_t nClasses, std::size_t /*nValues*/) : mvfSums(nClasses), mvnCounts(nClasses) {}

    template <class TValue>
    void Add(std::size_t nClass, TValue xValue)
    {
        if (nClass < mvnCounts.size())
        {
            mvfSums[nClass] += static_cast<float>(xValue);
            mvnCounts[nClass] += 1;
        }
    }

    void Finish(std::vector<int>& vnTable) const
    {
        for (std::size_t c = 0; c < mvnCounts.size(); ++c)
        {
            if (mvnCounts[c] != 0)
            {
                const float fMean = mvfSums[c] / static_cast<float>(mvnCounts[c]);
                vnTable[c] = CutToInt(double{fMean} + 0.5);
            }
        }
    }

private:
    std::vector<float> mvfSums;
    std::vector<std::uint32_t> mvnCounts;
};

class Modes
{
public:
    // Values from the number of classes on are counted in the totals alone: nobody looks at them.
    Modes(std::size_t nClasses, std::size_t nValues)
        : mnValues(std::min(nClasses, nValues)), mvoCounts(nClasses), mvnTotals(nClasses)
    {
    }

    template <class TValue>
    void Add(std::size_t nClass, TValue xValue)
    {
        if (nClass >= mvnTotals.size())
        {
            return;
        }
        mvnTotals[nClass] += 1;
        const std::size_t nValue = IndexOf(xValue);
        if (nValue < mnValues)
        {
            mvoCounts[nClass].Add(static_cast<std::uint16_t>(nValue));
        }
    }

    void Finish(float fThreshold, int nDefault, std::vector<int>& vnTable) const
    {
        for (std::size_t c = 0; c < mvnTotals.size(); ++c)
        {
            const ValueCounts::Mode oMode = mvoCounts[c].FindMode();
            if (oMode.mnCount > 0)
            {
                vnTable[c] = static_cast<int>(oMode.mnValue);
            }
            const float fShare =
                static_cast<float>(oMode.mnCount) / static_cast<float>(mvnTotals[c]);
            if (mvnTotals[c] != 0 && fThreshold > fShare)
            {
                vnTable[c] = nDefault;
            }
        }
    }

private:
    std::size_t mnValues;
    std::vector<ValueCounts> mvoCounts;
    std::vector<std::uint32_t> mvnTotals;
};

/// Adds the first channels of a block of values and a block of classes, row by row.
template <class TValue, class TClass, class Table>
void AddRows(const Raster& oValues, const Raster& oClasses, Table& oTable)
{
    for (std::uint32_t y = 0; y < oValues.mnHeight; ++y)
    {
        const TValue* pValue = oValues.GetPixelAs<TValue>(0, y);
        const TClass* pClass = oClasses.GetPixelAs<TClass>(0, y);
        for (std::uint32_t x = 0; x < oValues.mnWidth; ++x)
        {
            oTable.Add(IndexOf(*pClass), *pValue);
            pValue += oValues.mnChannels;
            pClass += oClasses.mnChannels;
        }
    }
}

template <class Table>
using RowsFunction = void (*)(const Raster&, const Raster&, Table&);

template <class Table>
struct ServedPair
{
    DataType oValues;
    DataType oClasses;
    RowsFunction<Table> pfnAddRows;
};

/// The function for a pair of types; null for those that are not served.
template <class Table>
RowsFunction<Table> FindRowsFunction(const DataType& oValues, const DataType& oClasses)
{
    using namespace tessel;
    using U8 = unsigned char;
    using U16 = unsigned short;
    // Meant: 8-bit values with 16-bit unsigned classes are not among them.
    static constexpr ServedPair<Table> kPairs[] = {
        {eDT_32R, eDT_8U, AddRows<float, U8, Table>},
        {eDT_32R, eDT_32R, AddRows<float, float, Table>},
        {eDT_32R, eDT_16U, AddRows<float, U16, Table>},
        {eDT_32R, eDT_16S, AddRows<float, short, Table>},
        {eDT_16U, eDT_8U, AddRows<U16, U8, Table>},
        {eDT_16U, eDT_32R, AddRows<U16, float, Table>},
        {eDT_16U, eDT_16U, AddRows<U16, U16, Table>},
        {eDT_16U, eDT_16S, AddRows<U16, short, Table>},
        {eDT_16S, eDT_8U, AddRows<short, U8, Table>},
        {eDT_16S, eDT_32R, AddRows<short, float, Table>},
        {eDT_16S, eDT_16U, AddRows<short, U16, Table>},
        {eDT_16S, eDT_16S, AddRows<short, short, Table>},
        {eDT_8U, eDT_8U, AddRows<U8, U8, Table>},
        {eDT_8U, eDT_32R, AddRows<U8, float, Table>},
        {eDT_8U, eDT_16S, AddRows<U8, short, Table>},
    };
    for (const ServedPair<Table>& oPair : kPairs)
    {
        if (oPair.oValues == oValues && oPair.oClasses == oClasses)
        {
            return oPair.pfnAddRows;
        }
    }
    return nullptr;
}

/// Rows that both readers read at a time: files in tiles, such as compressed ones, are slow row by
/// row. Pixels come in the same order.
unsigned int RowsAtOnce(const datasources::IRasterReader& oValues,
                        const datasources::IRasterReader& oClasses)
{
    constexpr std::uint64_t kMostBytes = 1U << 24;
    const auto oPixelBytes = [](const datasources::IRasterReader& oReader)
    { return std::uint64_t{oReader.GetChannelCount()} * oReader.GetDataType().GetSampleBytes(); };
    const std::uint64_t nRowBytes =
        std::max(oPixelBytes(oValues), oPixelBytes(oClasses)) * oValues.GetWidth();
    const std::uint64_t nMost = kMostBytes / std::max<std::uint64_t>(nRowBytes, 1);
    return static_cast<unsigned int>(
        std::max<std::uint64_t>(std::min<std::uint64_t>(nMost, oValues.GetHeight()), 1));
}

/// Shows all rows of both readers to a table.
template <class Table>
Table Gather(datasources::IRasterReader& oValues, datasources::IRasterReader& oClasses)
{
    Table oTable(TableSize(oClasses.GetDataType()), TableSize(oValues.GetDataType()));
    const auto pfnAddRows = FindRowsFunction<Table>(oValues.GetDataType(), oClasses.GetDataType());
    const unsigned int nRows = RowsAtOnce(oValues, oClasses);
    oValues.SetTileSize(oValues.GetWidth(), nRows);
    oClasses.SetTileSize(oClasses.GetWidth(), nRows);
    const unsigned int nTiles = (oValues.GetHeight() + nRows - 1) / nRows;
    for (unsigned int nTile = 0; pfnAddRows != nullptr && nTile < nTiles; ++nTile)
    {
        const std::unique_ptr<Raster> poValues(oValues.GetRaster(nTile));
        const std::unique_ptr<Raster> poClasses(oClasses.GetRaster(nTile));
        pfnAddRows(*poValues, *poClasses, oTable);
    }
    return oTable;
}

}  // namespace

HOMStatistics::HOMStatistics(std::string& oFile, std::vector<unsigned int> oValues,
                             std::vector<unsigned int> oClasses, std::vector<unsigned int> oOthers,
                             std::vector<unsigned int> oCalcMode, std::vector<float> oThreshold,
                             std::vector<int> oDefault)
    : moFileName(oFile),
      mvValueChannels(std::move(oValues)),
      mvClassChannels(std::move(oClasses)),
      mvOtherChannels(std::move(oOthers)),
      mvCalcMode(std::move(oCalcMode)),
      mvDefault(std::move(oDefault)),
      mvThreshold(std::move(oThreshold))
{
}

void HOMStatistics::GetRasterStats()
{
    datasources::BasicReader oValues(moFileName, mvValueChannels, 1);
    datasources::BasicReader oClasses(moFileName, mvClassChannels, 1);
    mvMeanMode.resize(mvMeanMode.size() + TableSize(oClasses.GetDataType()), 0);
    try
    {
        FillTable(oValues, oClasses);
    }
    catch (const std::bad_alloc&)
    {
        throw Exception("There is no memory to count the values of the classes of " + moFileName,
                        "processes/qrdfilters/filterhom", __PRETTY_FUNCTION__, __LINE__);
    }
}

void HOMStatistics::FillTable(datasources::IRasterReader& oValues,
                              datasources::IRasterReader& oClasses)
{
    switch (ElementOf(mvCalcMode, 0))
    {
        case 0:
            Gather<Means>(oValues, oClasses).Finish(mvMeanMode);
            break;
        case 1:
            Gather<Modes>(oValues, oClasses)
                .Finish(ElementOf(mvThreshold, 0), ElementOf(mvDefault, 0), mvMeanMode);
            break;
        default:
            break;
    }
}

}  // namespace kor::filters
