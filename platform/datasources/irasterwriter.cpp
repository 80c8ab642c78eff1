#include "platform/datasources/irasterwriter.h"

#include "platform/exception/exception.h"

namespace kor::datasources
{

void IRasterWriter::SetAuxiliaryData(const AuxiliaryData& /*oData*/)
{
    throw IOException("This writer has no place for auxiliary data",
                      "platform/datasources/irasterwriter", __PRETTY_FUNCTION__, __LINE__);
}

}  // namespace kor::datasources
