#include "processes/qrdfilters/samplerows.h"

#include <cstring>

#include "processes/qrdfilters/sampleconversion.h"

namespace kor::filters
{

template <class TIn, class TOut>
void ConvertSamples(const TIn* pIn, TOut* pOut, std::size_t nCount)
{
    if constexpr (std::is_same_v<TIn, TOut>)
    {
        if (nCount != 0)
        {
            std::memmove(pOut, pIn, nCount * sizeof(TIn));
        }
    }
    else
    {
        for (std::size_t i = 0; i < nCount; ++i)
        {
            pOut[i] = ConvertSample<TIn, TOut>(pIn[i]);
        }
    }
}

template <class TIn>
void LoadSamples(const TIn* pIn, std::span<double> vdfOut)
{
    ConvertSamples<TIn, double>(pIn, vdfOut.data(), vdfOut.size());
}

template <class TOut>
void StoreSamples(std::span<const double> vdfIn, TOut* pOut)
{
    ConvertSamples<double, TOut>(vdfIn.data(), pOut, vdfIn.size());
}

template void LoadSamples(const char*, std::span<double>);
template void StoreSamples(std::span<const double>, char*);
template void ConvertSamples(const char*, char*, std::size_t);
template void ConvertSamples(const char*, unsigned char*, std::size_t);
template void ConvertSamples(const char*, short*, std::size_t);
template void ConvertSamples(const char*, unsigned short*, std::size_t);
template void ConvertSamples(const char*, int*, std::size_t);
template void ConvertSamples(const char*, unsigned int*, std::size_t);
template void ConvertSamples(const char*, float*, std::size_t);
template void ConvertSamples(const char*, double*, std::size_t);
template void ConvertSamples(const char*, int64*, std::size_t);
template void ConvertSamples(const char*, uint64*, std::size_t);

template void LoadSamples(const unsigned char*, std::span<double>);
template void StoreSamples(std::span<const double>, unsigned char*);
template void ConvertSamples(const unsigned char*, char*, std::size_t);
template void ConvertSamples(const unsigned char*, unsigned char*, std::size_t);
template void ConvertSamples(const unsigned char*, short*, std::size_t);
template void ConvertSamples(const unsigned char*, unsigned short*, std::size_t);
template void ConvertSamples(const unsigned char*, int*, std::size_t);
template void ConvertSamples(const unsigned char*, unsigned int*, std::size_t);
template void ConvertSamples(const unsigned char*, float*, std::size_t);
template void ConvertSamples(const unsigned char*, double*, std::size_t);
template void ConvertSamples(const unsigned char*, int64*, std::size_t);
template void ConvertSamples(const unsigned char*, uint64*, std::size_t);

template void LoadSamples(const short*, std::span<double>);
template void StoreSamples(std::span<const double>, short*);
template void ConvertSamples(const short*, char*, std::size_t);
template void ConvertSamples(const short*, unsigned char*, std::size_t);
template void ConvertSamples(const short*, short*, std::size_t);
template void ConvertSamples(const short*, unsigned short*, std::size_t);
template void ConvertSamples(const short*, int*, std::size_t);
template void ConvertSamples(const short*, unsigned int*, std::size_t);
template void ConvertSamples(const short*, float*, std::size_t);
template void ConvertSamples(const short*, double*, std::size_t);
template void ConvertSamples(const short*, int64*, std::size_t);
template void ConvertSamples(const short*, uint64*, std::size_t);

template void LoadSamples(const unsigned short*, std::span<double>);
template void StoreSamples(std::span<const double>, unsigned short*);
template void ConvertSamples(const unsigned short*, char*, std::size_t);
template void ConvertSamples(const unsigned short*, unsigned char*, std::size_t);
template void ConvertSamples(const unsigned short*, short*, std::size_t);
template void ConvertSamples(const unsigned short*, unsigned short*, std::size_t);
template void ConvertSamples(const unsigned short*, int*, std::size_t);
template void ConvertSamples(const unsigned short*, unsigned int*, std::size_t);
template void ConvertSamples(const unsigned short*, float*, std::size_t);
template void ConvertSamples(const unsigned short*, double*, std::size_t);
template void ConvertSamples(const unsigned short*, int64*, std::size_t);
template void ConvertSamples(const unsigned short*, uint64*, std::size_t);

template void LoadSamples(const int*, std::span<double>);
template void StoreSamples(std::span<const double>, int*);
template void ConvertSamples(const int*, char*, std::size_t);
template void ConvertSamples(const int*, unsigned char*, std::size_t);
template void ConvertSamples(const int*, short*, std::size_t);
template void ConvertSamples(const int*, unsigned short*, std::size_t);
template void ConvertSamples(const int*, int*, std::size_t);
template void ConvertSamples(const int*, unsigned int*, std::size_t);
template void ConvertSamples(const int*, float*, std::size_t);
template void ConvertSamples(const int*, double*, std::size_t);
template void ConvertSamples(const int*, int64*, std::size_t);
template void ConvertSamples(const int*, uint64*, std::size_t);

template void LoadSamples(const unsigned int*, std::span<double>);
template void StoreSamples(std::span<const double>, unsigned int*);
template void ConvertSamples(const unsigned int*, char*, std::size_t);
template void ConvertSamples(const unsigned int*, unsigned char*, std::size_t);
template void ConvertSamples(const unsigned int*, short*, std::size_t);
template void ConvertSamples(const unsigned int*, unsigned short*, std::size_t);
template void ConvertSamples(const unsigned int*, int*, std::size_t);
template void ConvertSamples(const unsigned int*, unsigned int*, std::size_t);
template void ConvertSamples(const unsigned int*, float*, std::size_t);
template void ConvertSamples(const unsigned int*, double*, std::size_t);
template void ConvertSamples(const unsigned int*, int64*, std::size_t);
template void ConvertSamples(const unsigned int*, uint64*, std::size_t);

template void LoadSamples(const float*, std::span<double>);
template void StoreSamples(std::span<const double>, float*);
template void ConvertSamples(const float*, char*, std::size_t);
template void ConvertSamples(const float*, unsigned char*, std::size_t);
template void ConvertSamples(const float*, short*, std::size_t);
template void ConvertSamples(const float*, unsigned short*, std::size_t);
template void ConvertSamples(const float*, int*, std::size_t);
template void ConvertSamples(const float*, unsigned int*, std::size_t);
template void ConvertSamples(const float*, float*, std::size_t);
template void ConvertSamples(const float*, double*, std::size_t);
template void ConvertSamples(const float*, int64*, std::size_t);
template void ConvertSamples(const float*, uint64*, std::size_t);

template void LoadSamples(const double*, std::span<double>);
template void StoreSamples(std::span<const double>, double*);
template void ConvertSamples(const double*, char*, std::size_t);
template void ConvertSamples(const double*, unsigned char*, std::size_t);
template void ConvertSamples(const double*, short*, std::size_t);
template void ConvertSamples(const double*, unsigned short*, std::size_t);
template void ConvertSamples(const double*, int*, std::size_t);
template void ConvertSamples(const double*, unsigned int*, std::size_t);
template void ConvertSamples(const double*, float*, std::size_t);
template void ConvertSamples(const double*, double*, std::size_t);
template void ConvertSamples(const double*, int64*, std::size_t);
template void ConvertSamples(const double*, uint64*, std::size_t);

template void LoadSamples(const int64*, std::span<double>);
template void StoreSamples(std::span<const double>, int64*);
template void ConvertSamples(const int64*, char*, std::size_t);
template void ConvertSamples(const int64*, unsigned char*, std::size_t);
template void ConvertSamples(const int64*, short*, std::size_t);
template void ConvertSamples(const int64*, unsigned short*, std::size_t);
template void ConvertSamples(const int64*, int*, std::size_t);
template void ConvertSamples(const int64*, unsigned int*, std::size_t);
template void ConvertSamples(const int64*, float*, std::size_t);
template void ConvertSamples(const int64*, double*, std::size_t);
template void ConvertSamples(const int64*, int64*, std::size_t);
template void ConvertSamples(const int64*, uint64*, std::size_t);

template void LoadSamples(const uint64*, std::span<double>);
template void StoreSamples(std::span<const double>, uint64*);
template void ConvertSamples(const uint64*, char*, std::size_t);
template void ConvertSamples(const uint64*, unsigned char*, std::size_t);
template void ConvertSamples(const uint64*, short*, std::size_t);
template void ConvertSamples(const uint64*, unsigned short*, std::size_t);
template void ConvertSamples(const uint64*, int*, std::size_t);
template void ConvertSamples(const uint64*, unsigned int*, std::size_t);
template void ConvertSamples(const uint64*, float*, std::size_t);
template void ConvertSamples(const uint64*, double*, std::size_t);
template void ConvertSamples(const uint64*, int64*, std::size_t);
template void ConvertSamples(const uint64*, uint64*, std::size_t);

}  // namespace kor::filters
