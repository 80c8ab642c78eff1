#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "platform/datasources/datasetmanager.h"
#include "tests/support/memorydataset.h"
#include "tests/support/temporarydirectory.h"

/// Datasets in memory for what opens its datasets by their names: files that stand for them.
namespace kor::test
{

/// Opens files of "KOR MEMORY FILE" and a number by what was kept under that number. It knows no
/// bitmaps.
class MemoryFileDriver : public datasources::IDatasetDriver
{
public:
    using Maker = std::function<std::unique_ptr<MemoryDataset>()>;

    /// Writes a file that opens as what oMake makes, and returns its name.
    static std::string Write(const TemporaryDirectory& oFolder, Maker oMake)
    {
        datasources::DatasetManager::RegisterDriver(std::make_unique<MemoryFileDriver>());
        Makers().push_back(std::move(oMake));
        return oFolder.Write("memory" + std::to_string(Makers().size()),
                             kMagic + std::to_string(Makers().size() - 1));
    }

    std::string GetName() const override { return "memory files"; }
    bool Recognizes(const std::string& oFile) const override
    {
        return BytesOf(oFile).starts_with(kMagic);
    }
    std::unique_ptr<datasources::IDataset> Open(const std::string& oFile,
                                                bool /*bUpdate*/) const override
    {
        return Makers().at(std::stoul(BytesOf(oFile).substr(kMagic.size())))();
    }
    bool HasFormat(const std::string& /*oFormat*/) const override { return false; }
    std::unique_ptr<datasources::IDataset> Create(const std::string& /*oFile*/,
                                                  const std::string& /*oFormat*/,
                                                  const std::string& /*oOptions*/) const override
    {
        return nullptr;
    }

private:
    static inline const std::string kMagic = "KOR MEMORY FILE";

    static std::vector<Maker>& Makers()
    {
        static std::vector<Maker> oMakers;
        return oMakers;
    }
};

}  // namespace kor::test
