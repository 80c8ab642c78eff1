#pragma once

#include <string>

#include "platform/datasources/auxiliarydata.h"
#include "platform/geocoding/geocodinginfo.h"

namespace kor::datasources
{

/// An open file. What it holds is asked of the kinds that derive from it: a dataset may be an
/// IRasterDataset, an IBitmapDataset or both.
///
/// Errors   kor::IOException, kor::FileException or kor::DataException with the file's name and the
///          reason. Changing a dataset that was opened for reading: kor::IOException.
/// Threads  the dataset itself serves one thread at a time; the readers and writers made from it
///          may each work on a thread of their own. They must go before the dataset does.
class IDataset
{
public:
    virtual ~IDataset() = default;

    /// The name that it was opened or made by.
    virtual std::string GetFileName() const = 0;
    virtual AuxiliaryData GetAuxiliaryData() const = 0;
    virtual void SetAuxiliaryData(const AuxiliaryData& oData) = 0;
    virtual const ogc::cs::GeocodingInfo& GetGeocodingInfo() const = 0;
    virtual void SetGeocodingInfo(const ogc::cs::GeocodingInfo& oInfo) = 0;

    /// Brings everything written so far into the file and throws when that fails (a full disk, for
    /// instance). Destroying a dataset does the same, but cannot report: whoever needs to know that
    /// the file is whole calls this last. Does nothing on a dataset opened for reading.
    virtual void Flush() {}
};

}  // namespace kor::datasources
