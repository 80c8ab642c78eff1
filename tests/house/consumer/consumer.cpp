#include <cstdio>

#include "basic/tessel/raster/raster.h"
#include "processes/qrdfilters/filtermedian.h"

// The middle one of three samples in a row; the outer two are margins.
int main()
{
    using namespace kor;
    unsigned char anSamples[] = {1, 7, 3};
    tessel::Raster oIn({1, 1, 1, tessel::eDT_8U}, {1, 0, 0, 0}, anSamples, false);
    tessel::Raster oOut({1, 1, 1, tessel::eDT_8U}, {0, 0, 0, 0});
    filters::FilterMedian().Process(&oIn, nullptr, &oOut, nullptr);
    std::printf("median of 1, 7, 3: %d\n", *oOut.GetPixel(0, 0));
    return *oOut.GetPixel(0, 0) == 3 ? 0 : 1;
}
