#include "platform/datasources/kordsk/kordskdriver.h"

#include <fcntl.h>

#include <algorithm>
#include <array>
#include <sstream>

#include "platform/datasources/kordsk/kordskdataset.h"
#include "platform/exception/exception.h"

namespace kor::datasources
{

namespace
{

constexpr const char* kFormat = "KORDSK";

bool IsTiled(const std::string& oFile, const std::string& oOptions)
{
    std::istringstream oWords(oOptions);
    std::string oOption;
    std::string oMore;
    oWords >> oOption >> oMore;
    if ((!oOption.empty() && oOption != "BAND" && oOption != "TILE") || !oMore.empty())
    {
        throw DataException(
            oFile + ": the options are \"" + oOptions + "\"; a KORDSK file takes BAND or TILE",
            "platform/datasources/kordsk/kordskdriver", __PRETTY_FUNCTION__, __LINE__);
    }
    return oOption == "TILE";
}

class KordskDriver : public IDatasetDriver
{
public:
    std::string GetName() const override { return kFormat; }

    bool Recognizes(const std::string& oFile) const override
    {
        try
        {
            // One slot may be damaged.
            std::array<unsigned char, kSlotBytes * kSlotCount> anSlots{};
            const FileDescriptor oDescriptor(oFile, O_RDONLY);
            oDescriptor.ReadAt(0, std::span(anSlots).first(std::min<std::uint64_t>(
                                      anSlots.size(), oDescriptor.GetSize())));
            return HasSlotMagic(std::span(anSlots).first(kSlotBytes)) ||
                   HasSlotMagic(std::span(anSlots).last(kSlotBytes));
        }
        catch (const IOException&)
        {
            return false;
        }
    }

    std::unique_ptr<IDataset> Open(const std::string& oFile, bool bUpdate) const override
    {
        return std::make_unique<KordskDataset>(oFile, bUpdate);
    }

    bool HasFormat(const std::string& oFormat) const override { return oFormat == kFormat; }

    std::unique_ptr<IDataset> Create(const std::string& oFile, const std::string& /*oFormat*/,
                                     const std::string& oOptions) const override
    {
        return std::make_unique<KordskDataset>(KordskFile::Create(oFile, IsTiled(oFile, oOptions)),
                                               oFile);
    }
};

}  // namespace

std::unique_ptr<IDatasetDriver> MakeKordskDriver()
{
    return std::make_unique<KordskDriver>();
}

}  // namespace kor::datasources
