#pragma once

#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/basicreader.h"
#include "platform/datasources/idataset.h"

namespace kor::filters
{

namespace details
{

/// Parameters of SarSim1. Each is a list, as a user gives it, of which the elements told here are
/// read.
class SarSim1Params
{
public:
    SarSim1Params() = default;
    SarSim1Params(std::vector<unsigned int> vnDbec, std::vector<int> vnDbiw,
                  std::vector<double> vdfEscale, std::vector<double> vdfBackelev,
                  std::vector<double> vdfOutputxsz, std::vector<double> vdfAlti,
                  std::vector<double> vdfHead, std::vector<double> vdfMinlook,
                  std::vector<double> vdfNRPoint, std::vector<int> vnOversamp);

    /// Channels of the elevations, for the caller: nothing here reads them.
    void SetDbec(std::vector<unsigned int> vnDbec) { Dbec = std::move(vnDbec); }
    /// The DEM window in pixels of its dataset: x offset, y offset, width, height.
    void SetDbiw(std::vector<int> vnDbiw) { Dbiw = std::move(vnDbiw); }
    /// Scale and offset: an elevation in metres is (sample + offset) * scale, both cut to 16-bit
    /// integers, and the result too. Meant: an offset of exactly 0 is replaced by the lowest
    /// sample found, which is added (not for 8-bit DEMs).
    void SetEscale(std::vector<double> vdfEscale) { Escale = std::move(vdfEscale); }
    /// The sample that marks pixels without an elevation.
    void SetBackelev(std::vector<double> vdfBackelev) { Backelev = std::move(vdfBackelev); }
    /// Radar pixel in metres: in range, in azimuth.
    void SetOutputxsz(std::vector<double> vdfOutputxsz) { Outputxsz = std::move(vdfOutputxsz); }
    /// Altitude of the sensor above the sphere, metres. See SarSim1 for exactly 800000.
    void SetAlti(std::vector<double> vdfAlti) { Alti = std::move(vdfAlti); }
    /// Heading of the track, degrees clockwise from north, 0 to 360. The sensor looks to the right.
    void SetHead(std::vector<double> vdfHead) { Head = std::move(vdfHead); }
    /// Look angle at the near range point, degrees from nadir.
    void SetMinlook(std::vector<double> vdfMinlook) { Minlook = std::move(vdfMinlook); }
    /// Near range point in map coordinates, x and y. Empty: the upper left corner of the window,
    /// which Process then puts here.
    void SetNRPoint(std::vector<double> vdfNRPoint) { NRPoint = std::move(vdfNRPoint); }
    /// Sub-samples on each side of a DEM cell, from 1.
    void SetOversamp(std::vector<int> vnOversamp) { Oversamp = std::move(vnOversamp); }
    /// For the caller: nothing here reads it. 0 at first.
    void SetSarseg(int nSarseg) { Sarseg = nSarseg; }
    /// True: Output writes the lines of the image from last to first, not those of the masks. False
    /// at first.
    void SetFlip(bool bFlip) { Flip = bFlip; }

    const std::vector<double>& GetEscale() const { return Escale; }
    const std::vector<double>& GetNRPoint() const { return NRPoint; }

protected:
    std::vector<unsigned int> Dbec;
    std::vector<int> Dbiw;
    std::vector<double> Escale;
    std::vector<double> Backelev;
    std::vector<double> Outputxsz;
    std::vector<double> Alti;
    std::vector<double> Head;
    std::vector<double> Minlook;
    std::vector<double> NRPoint;
    std::vector<int> Oversamp;
    int Sarseg = 0;
    bool Flip = false;
};

}  // namespace details

/// Simulates the image that a side-looking radar would take of a terrain, in radar geometry:
/// columns run in ground range, lines along the track.
///
/// The earth is a sphere of 6370 km, the track a circle above it. Each cell between four DEM pixels
/// is cut into Oversamp x Oversamp points with bilinear elevations. Each point goes to the line of
/// its place along the track, and to the column of its slant range, taken back to the sphere at
/// elevation 0. The image counts the points that meet in a pixel: bright where a slope faces the
/// sensor. A point is in shadow where a nearer one of its line was seen under a larger look angle,
/// in layover where it falls nearer to the sensor than one before it, by half a pixel at least.
///
/// Input    a DEM of any real type in one channel, in metres once scaled, its map coordinates those
///          of a grid in metres with a false easting of 500000. Rows are seen as 16-bit integers by
///          the library's conversion rules. Column i of the window is column i of the dataset, its
///          rows begin at the y offset; the x offset counts in the map coordinates alone.
/// Output   eDT_16U counts, which wrap at 65536; two masks of one bit a pixel.
/// Corners  an altitude of exactly 800000 measures ground range along the chord of a swath of 97
///          km. Headings of 0, 270 and 360 and above do not mirror the columns, those between do.
///          A cell is left out where the pixel to the right of its first column, in the row behind,
///          is background. Beyond 10000 lines, the rows of the image are used again and those
///          lines are lost. Lines that no point met stay 0. What would fall outside the image is
///          dropped.
/// Errors   Process: kor::ParameterException for a list that is too short or a window that is empty
///          or has rows outside the image; kor::Exception where no image comes of the parameters or
///          the machine has not the memory. Output: kor::Exception before Process, and for a
///          dataset without channels or bitmaps. Both: what the dataset throws.
/// Threads  works on the calling thread; one object serves one thread.
/// State    copies share the image of a processed object. Process may be called again: it makes a
///          new image, from NRPoint and Escale as the last call left them.
class SarSim1 : public details::SarSim1Params
{
public:
    SarSim1() = default;
    SarSim1(std::vector<unsigned int> vnDbec, std::vector<int> vnDbiw,
            std::vector<double> vdfEscale, std::vector<double> vdfBackelev,
            std::vector<double> vdfOutputxsz, std::vector<double> vdfAlti,
            std::vector<double> vdfHead, std::vector<double> vdfMinlook,
            std::vector<double> vdfNRPoint, std::vector<int> vnOversamp);

    /// Runs the simulation. The reader's tiles are single rows afterwards.
    void Process(datasources::BasicReader& oReader);

    /// Size of the image in lines and pixels; 0 before Process.
    int GetSarlin() const;
    int GetSarpix() const;

    /// Writes the image and its masks into a new KORDSK file.
    void Output(std::string oFile) const;
    /// The same into a dataset, which has to hold both channels and bitmaps: a channel of eDT_16U
    /// is made and two bitmaps, layover and shadow. Meant: the image is written to channel 1, which
    /// is the new one where the dataset had none.
    void Output(datasources::IDataset* poDataset) const;

    /// Projects a point as Process does: dfElevation metres high, dfX metres east of the window's
    /// left edge, dfY metres north of the near range point. Gives the look angle in degrees and the
    /// ground range in metres. The window and orbit are those of the last Process.
    void range(float fAlti, float fHead, double dfElev, double dfX, double dfY, double* pdfLook,
               double* pdfRange) const;

private:
    class RadarImage;
    class Run;

    void RequireImage() const;

    std::shared_ptr<const RadarImage> mpoImage;  ///< null before Process
};

}  // namespace kor::filters
