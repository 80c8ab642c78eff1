#pragma once

#include <memory>

#include "platform/datasources/idatasetdriver.h"

namespace kor::datasources
{

/// The driver of KORDSK files, see KordskDataset. DatasetManager has it from the start.
///
/// The format is called "KORDSK". Options of a new file: "BAND", or none, for planes row after row;
/// "TILE" for planes in tiles of 256 x 256 pixels. Others: kor::DataException.
std::unique_ptr<IDatasetDriver> MakeKordskDriver();

}  // namespace kor::datasources
