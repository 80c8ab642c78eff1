#include "platform/datasources/datatypename.h"

namespace kor::datasources
{

namespace
{

struct NamedType
{
    const char* mpszName;
    tessel::DataType moType;
};

constexpr NamedType kNamedTypes[] = {
    {"eDT_BIT", tessel::eDT_BIT},   {"eDT_8U", tessel::eDT_8U},     {"eDT_8S", tessel::eDT_8S},
    {"eDT_16U", tessel::eDT_16U},   {"eDT_16S", tessel::eDT_16S},   {"eDT_32U", tessel::eDT_32U},
    {"eDT_32S", tessel::eDT_32S},   {"eDT_32R", tessel::eDT_32R},   {"eDT_64U", tessel::eDT_64U},
    {"eDT_64S", tessel::eDT_64S},   {"eDT_64R", tessel::eDT_64R},   {"eDT_C16U", tessel::eDT_C16U},
    {"eDT_C16S", tessel::eDT_C16S}, {"eDT_C32U", tessel::eDT_C32U}, {"eDT_C32S", tessel::eDT_C32S},
    {"eDT_C32R", tessel::eDT_C32R}, {"eDT_C64R", tessel::eDT_C64R}};

}  // namespace

std::string DataTypeName(const tessel::DataType& oType)
{
    for (const NamedType& oNamed : kNamedTypes)
    {
        if (oNamed.moType == oType)
        {
            return oNamed.mpszName;
        }
    }
    return "a type of " + std::to_string(oType.mnBits) + " bits" +
           (oType.mbSigned ? ", signed" : ", unsigned") + (oType.mbFloat ? ", float" : "") +
           (oType.mbComplex ? ", complex" : "");
}

}  // namespace kor::datasources
