#pragma once

#include <vector>

#include "platform/datasources/irasterreader.h"
#include "platform/datasources/irasterwriter.h"
#include "platform/logging/iupdatehandler.h"
#include "processes/qrdfilters/typedfilter.h"

namespace kor::filters
{

namespace details
{

/// Parameters of Sarsim2. Each is a list, as a user gives it, of which the elements told here are
/// read. A worker that is kept keeps those that it was made with, see Sarsim2.
class SarSim2Params
{
public:
    SarSim2Params() = default;
    SarSim2Params(std::vector<unsigned int> vnDbiw, std::vector<double> vdfEscale,
                  std::vector<double> vdfAlti, std::vector<double> vdfHead,
                  std::vector<double> vdfMinlook, std::vector<double> vdfNRPoint,
                  std::vector<int> vnOversamp, parallelio::IUpdateHandler* poUpdateHandler);
    SarSim2Params(const SarSim2Params&) = default;
    SarSim2Params& operator=(const SarSim2Params&) = default;
    virtual ~SarSim2Params() = default;

    /// The DEM window in pixels of its dataset: x offset, y offset, width, height.
    void SetDbiw(std::vector<unsigned int> vnDbiw) { Dbiw = std::move(vnDbiw); }
    /// Scale and offset: an elevation in metres is (sample + offset) * scale. Meant: an offset
    /// of exactly 0 is replaced by the lowest sample found, which is added (not for 8-bit DEMs).
    void SetEscale(std::vector<double> vdfEscale) { Escale = std::move(vdfEscale); }
    /// Altitude of the sensor above the sphere, metres. Exactly 800000 is special, see SarSim1.
    void SetAlti(std::vector<double> vdfAlti) { Alti = std::move(vdfAlti); }
    /// Heading of the track, degrees clockwise from north, 0 to 360. The sensor looks to the right.
    void SetHead(std::vector<double> vdfHead) { Head = std::move(vdfHead); }
    /// Look angle at the near range point, degrees from nadir.
    void SetMinlook(std::vector<double> vdfMinlook) { Minlook = std::move(vdfMinlook); }
    /// Near range point in map coordinates, x and y. Empty: the upper left corner of the window.
    void SetNRPoint(std::vector<double> vdfNRPoint) { NRPoint = std::move(vdfNRPoint); }
    /// Sub-samples on each side of a DEM cell, from 1.
    void SetOversamp(std::vector<int> vnOversamp) { Oversamp = std::move(vnOversamp); }
    /// Null: no progress, no cancelling. Not owned.
    void SetUpdateHandler(parallelio::IUpdateHandler* const poHandler)
    {
        mpoUpdateHandler = poHandler;
    }

protected:
    std::vector<unsigned int> Dbiw;
    std::vector<double> Escale;
    std::vector<double> Alti;
    std::vector<double> Head;
    std::vector<double> Minlook;
    std::vector<double> NRPoint;
    std::vector<int> Oversamp;
    parallelio::IUpdateHandler* mpoUpdateHandler = nullptr;
};

}  // namespace details

/// The simulation for one pair of sample types.
class ISarSim2
{
public:
    ISarSim2() = default;
    ISarSim2(const ISarSim2&) = delete;
    ISarSim2& operator=(const ISarSim2&) = delete;
    virtual ~ISarSim2() = default;
    virtual void Process(datasources::IRasterReader* poReader,
                         datasources::IRasterWriter* poRasterWriter,
                         datasources::IRasterWriter* poLayoverWriter,
                         datasources::IRasterWriter* poShadowWriter) = 0;
};

/// Simulates the image that a side-looking radar would take of a terrain, in map geometry: each
/// pixel of the DEM gets what the radar sees in its place.
///
/// Pass one makes the image of SarSim1 with radar pixels as large as those of the DEM. Pass two
/// projects each pixel of the DEM and takes the four counts around it, bilinear; those of an 8-bit
/// DEM as 255 * sqrt(count / largest count). Pixels that fall on the frame of the radar image, or
/// outside it, take one count. Layover and shadow are those of the nearest radar pixel.
///
/// Input    a DEM of any of the ten real types, see SarSim1. There is no background: all samples
///          are elevations. Scaled samples are stored as the DEM's type before they are used in
///          pass one (integers by the library's conversion rules), not in pass two.
/// Output   one row for each DEM row of the window, at its place in the dataset. Image: any of the
///          ten real types; integers are cut, not clamped. Layover and shadow: 0 or 1, in the first
///          byte of a sample, whatever the writer's type.
/// Corners  as for SarSim1, but: lines of pass two count in DEM pixels along x, where those of pass
///          one count along y; the row's share of the distance to the near range point is one metre
///          a row; and columns lie one pixel further. A count taken of an 8-bit DEM is replaced by
///          what was made of it, so that a pixel met again is compressed again: results then depend
///          on the scan order. From 32768 on, the largest count of 16 bits turns negative; the
///          square roots are then not numbers, and 0 as integers. All this is meant.
/// Errors   kor::Exception "poReader is invalid pointer", and so for poRasterWriter,
///          poLayoverWriter and poShadowWriter; "Invalid type requested."; else those of SarSim1.
/// Threads  works on the calling thread; one object serves one thread.
/// State    the worker for the last pair of types is kept, with the parameters that it was made
///          with and with what its last run put into Escale and NRPoint. What is set later counts
///          when the types change. Copies share the worker.
class Sarsim2 : public details::SarSim2Params, private ProcessorCache<ISarSim2>
{
public:
    template <class TIn, class TOut>
    class InnerProcessor;

    Sarsim2() = default;
    Sarsim2(std::vector<unsigned int> vnDbiw, std::vector<double> vdfEscale,
            std::vector<double> vdfAlti, std::vector<double> vdfHead,
            std::vector<double> vdfMinlook, std::vector<double> vdfNRPoint,
            std::vector<int> vnOversamp, parallelio::IUpdateHandler* const poUpdateHandler);
    Sarsim2(const Sarsim2&) = default;
    Sarsim2& operator=(const Sarsim2&) = default;
    ~Sarsim2() override = default;

    /// Tiles of the reader and of the writers are single rows afterwards. The handler is told 0 at
    /// the start, 0.2 to 0.6 in pass one, 0.6 to 1 in pass two and 1 at the end, and asked before
    /// each row whether the run is cancelled: that ends it without an error, with the rows that are
    /// written.
    void Process(datasources::IRasterReader* poReader, datasources::IRasterWriter* poRasterWriter,
                 datasources::IRasterWriter* poLayoverWriter,
                 datasources::IRasterWriter* poShadowWriter);

private:
    class Worker;
    class Run;

    void RequireParameters() const;
};

}  // namespace kor::filters
