#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <utility>

#include "basic/tessel/mask/imaskbuilder.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster/raster.h"
#include "platform/tessel/complexinterpretation.h"
#include "processes/qrdfilters/parallelio/filteriodriver.h"
#include "processes/qrdfilters/window.h"

/// Any filter of the library over an image of any size and type:
///
///     datasources::BasicReader oReader("in.tif", {1}, 0);
///     datasources::BasicWriter oWriter(poOutput, {1});
///     parallelio::FilterDriver oDriver(
///         parallelio::FilterAlgorithm(filters::FilterAverage(), filters::Window{3, 3}));
///     oDriver.Run(&oReader, &oWriter);
namespace kor::parallelio
{

/// A filter that works on blocks of doubles: its caller converts.
template <class Filter>
concept FilterOfDoubles = requires(Filter& oFilter, tessel::Raster* poRaster, tessel::Mask* poMask)
{
    oFilter.ProcessBlock(poRaster, poMask, poRaster, poMask);
};

/// A filter that takes blocks of any types, with a mask for its input and one for its output.
template <class Filter>
concept FilterOfAnyTypes =
    !FilterOfDoubles<Filter> &&
    requires(Filter & oFilter, tessel::Raster* poRaster, tessel::Mask* poMask)
{
    oFilter.Process(poRaster, poMask, poRaster, poMask);
};

/// The same with one mask.
template <class Filter>
concept FilterWithOneMask =
    !FilterOfDoubles<Filter> && !FilterOfAnyTypes<Filter> &&
    requires(Filter & oFilter, tessel::Raster* poRaster, tessel::Mask* poMask)
{
    oFilter.Process(poRaster, poMask, poRaster);
};

template <class Filter>
concept BlockFilter =
    FilterOfDoubles<Filter> || FilterOfAnyTypes<Filter> || FilterWithOneMask<Filter>;

/// A filter as an algorithm of the block driver: it converts a block with its margins to what the
/// filter works on, makes the masks, runs the filter and converts the result to the output's type
/// by the library's rules.
///
/// Filter   of doubles: blocks of other types are converted, there and back. A filter that answers
///          DoConvertBack() with false keeps its doubles: then the output has to be eDT_64R. Other
///          filters get the blocks as they are.
/// Input    any type. Of complex blocks a filter of doubles sees the magnitude, or what
///          SetComplexInterpretation says.
/// Masks    borrowed builders; without one for the input, FilterDriver masks missing data. A filter
///          with one mask gets that of the input.
/// Errors   kor::Exception when the output cannot take doubles, or memory for a converted block is
///          short; what the filter throws. All before the block's output is written.
/// Threads  one at a time. Copies share the filter and the memory for converted blocks.
class FilterAlgorithm
{
public:
    /// Keeps a copy of oFilter. oWindow: the window that the filter needs around each pixel; blocks
    /// are read with margins of just this size, so it is also the window of filters that go by the
    /// margins. None: the margins that the reader is set to.
    template <BlockFilter Filter>
    explicit FilterAlgorithm(Filter oFilter,
                             const std::optional<filters::Window>& oWindow = std::nullopt)
        : moWindow(oWindow),
          mbOfDoubles(FilterOfDoubles<Filter>),
          mbConvertsBack(ConvertsBack(oFilter)),
          mfnFilter(CallOf(std::make_shared<Filter>(std::move(oFilter))))
    {
    }

    /// Says which pixels enter windows; borrowed. Null, as at first: see SetMasksMissingData.
    void SetMaskBuilder(tessel::IMaskBuilder* poBuilder) { mpoMaskBuilder = poBuilder; }
    /// Says which pixels of the output are made; borrowed. It is shown the input block. Null, as at
    /// first: all.
    void SetOutputMaskBuilder(tessel::IMaskBuilder* poBuilder) { mpoOutputBuilder = poBuilder; }
    /// True, as at first: where no mask builder is set, samples that are not finite and the no-data
    /// values of the reader's channels are masked by ValidMaskBuilder, if the samples are floating
    /// point or there is such a value.
    void SetMasksMissingData(bool bMasks) { mbMasksMissingData = bMasks; }
    /// What complex samples are seen as, by all filters. Without a setting, filters of doubles see
    /// the magnitude, and others do as they do with complex blocks.
    void SetComplexInterpretation(tessel::KORInterpretationTypes eType) { meComplex = eType; }

    const std::optional<filters::Window>& GetWindow() const { return moWindow; }
    /// False when results stay doubles.
    bool DoConvertBack() const { return mbConvertsBack; }

    /// The builder of input masks: the one that was set, or that of missing data, or null.
    const tessel::IMaskBuilder* GetMaskBuilder() const;
    /// Looks at the reader of a run to come for missing data. The driver calls it.
    void LookForMissingData(const datasources::IRasterAccess& oReader);
    /// Bytes for a pixel that a block takes while it is filtered, beside input and output.
    std::uint64_t GetWorkBytes(const tessel::RasterInfo& oIn, const tessel::RasterInfo& oOut) const;

    void Process(tessel::Raster* poRasterIn, tessel::Mask* poMaskIn,
                 tessel::Raster* poRasterOut) const;

private:
    using Call =
        std::function<void(tessel::Raster*, tessel::Mask*, tessel::Raster*, tessel::Mask*)>;

    template <class Filter>
    static bool ConvertsBack(const Filter& oFilter)
    {
        if constexpr (requires { oFilter.DoConvertBack(); })
        {
            return oFilter.DoConvertBack();
        }
        return true;
    }

    template <class Filter>
    static Call CallOf(std::shared_ptr<Filter> poFilter)
    {
        return [poFilter](tessel::Raster* poIn, [[maybe_unused]] tessel::Mask* poMaskIn,
                          tessel::Raster* poOut, [[maybe_unused]] tessel::Mask* poMaskOut)
        {
            if constexpr (FilterWithOneMask<Filter>)
            {
                poFilter->Process(poIn, poMaskIn, poOut);
            }
            else
            {
                poFilter->Process(poIn, poMaskIn, poOut, poMaskOut);
            }
        };
    }

    /// Memory for working copies, kept from block to block: new pages for each cost more than many
    /// a filter.
    class Scratch
    {
    public:
        /// Doubles with the geometry of oRaster; their memory is lent until the next call.
        std::unique_ptr<tessel::Raster> DoublesLike(const tessel::Raster& oRaster);

    private:
        std::unique_ptr<double[]> mpSamples;
        std::size_t mnSamples = 0;
    };

    void FilterBlock(tessel::Raster* poIn, tessel::Mask* poMaskIn, tessel::Raster* poOut) const;

    std::optional<filters::Window> moWindow;
    bool mbOfDoubles;
    bool mbConvertsBack;
    Call mfnFilter;
    tessel::IMaskBuilder* mpoMaskBuilder = nullptr;
    tessel::IMaskBuilder* mpoOutputBuilder = nullptr;
    bool mbMasksMissingData = true;
    std::shared_ptr<const tessel::IMaskBuilder> mpoMissingData;
    std::optional<tessel::KORInterpretationTypes> meComplex;
    std::shared_ptr<Scratch> mpoScratchIn = std::make_shared<Scratch>();
    std::shared_ptr<Scratch> mpoScratchOut = std::make_shared<Scratch>();
};

/// Reads blocks with the margins that a filter needs, and keeps everything that is in memory for
/// them within the budget: the blocks of the pipeline with their margins and the filter's working
/// copies. Blocks of one row (or a tile's row) are not made smaller.
class FilterAccessPolicy : public DefaultAccessPolicy
{
public:
    /// Half the window; none keeps the reader's margins.
    void SetWindow(const std::optional<filters::Window>& oWindow) { moWindow = oWindow; }
    /// Bytes for a pixel of the block that is filtered, beside input and output.
    void SetWorkBytes(std::uint64_t nBytes) { mnWorkBytes = nBytes; }

    tessel::RasterContext GetReadContext(const tessel::RasterContext& oContext,
                                         const tessel::RasterInfo& oInfo) override;
    unsigned int GetMaxPixels(unsigned int nMemory, datasources::IRasterReader* poReader,
                              datasources::IRasterWriter* poWriter,
                              unsigned int& nMaxPixels) override;

private:
    std::optional<filters::Window> moWindow;
    std::uint64_t mnWorkBytes = 0;
};

/// The block driver around a filter. See FilterIODriver for the budget, and RunBlocks for
/// cancellation and errors.
template <class UpdateStrategy = DefaultUpdateStrategy>
class FilterDriver : public FilterIODriver<FilterAlgorithm, FilterAccessPolicy, UpdateStrategy>
{
public:
    explicit FilterDriver(FilterAlgorithm oAlgorithm)
        : FilterIODriver<FilterAlgorithm, FilterAccessPolicy, UpdateStrategy>(std::move(oAlgorithm))
    {
    }

    void Init(datasources::IRasterReader* poReader, datasources::IRasterWriter* poWriter) override
    {
        FilterAccessPolicy::Init(poReader, poWriter);
        this->SetWindow(this->GetWindow());
        if (poReader != nullptr)
        {
            this->LookForMissingData(*poReader);
            const datasources::IRasterAccess& oIn = *poReader;
            const datasources::IRasterAccess& oOut = poWriter != nullptr ? *poWriter : oIn;
            this->SetWorkBytes(this->GetWorkBytes(PixelOf(oIn), PixelOf(oOut)));
        }
    }

private:
    static tessel::RasterInfo PixelOf(const datasources::IRasterAccess& oAccess)
    {
        return {1, 1, oAccess.GetChannelCount(), oAccess.GetDataType()};
    }
};

FilterDriver(FilterAlgorithm)->FilterDriver<>;

}  // namespace kor::parallelio
