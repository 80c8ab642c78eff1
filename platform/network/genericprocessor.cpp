#include "platform/network/genericprocessor.h"

#include <algorithm>
#include <condition_variable>
#include <mutex>

#include "platform/system/omp.h"

namespace kor
{

namespace
{

constexpr const char* kSource = "platform/network/genericprocessor";

}  // namespace

namespace details
{

Arguments ArgumentsOf(boost::any& oValue, std::size_t nCount)
{
    auto* poArguments = boost::any_cast<Arguments>(&oValue);
    const std::size_t nReceived = poArguments != nullptr ? poArguments->size() : 1;
    if (poArguments == nullptr || nReceived < nCount)
    {
        throw Exception("Node expected " + std::to_string(nCount) +
                            " arguments but only received " + std::to_string(nReceived),
                        "", "", 0);
    }
    return *poArguments;
}

}  // namespace details

std::vector<std::uint64_t> GenericProcessor::GetOutputIDs(std::uint64_t nCount)
{
    std::vector<std::uint64_t> vnIds;
    for (std::uint64_t i = 0; i < nCount; ++i)
    {
        vnIds.push_back(mnNextId++);
    }
    return vnIds;
}

std::uint64_t GenericProcessor::AddValue(const boost::any& oValue, const std::string& oDescription)
{
    Entry oEntry;
    oEntry.moNode.moOutputs = GetOutputIDs(1);
    oEntry.moNode.moDescription = oDescription;
    oEntry.moNode.mnState = eS_Done;
    oEntry.moResult = oValue;
    oEntry.mbKept = true;
    mvoEntries.push_back(std::move(oEntry));
    return mvoEntries.back().moNode.moOutputs.front();
}

std::uint64_t GenericProcessor::Add(const boost::function<boost::any(boost::any&)>& oFunction,
                                    const std::vector<std::uint64_t>& oInputs,
                                    const std::string& oDescription)
{
    if (oFunction.empty())
    {
        throw Exception("oFunction is empty", kSource, __PRETTY_FUNCTION__, __LINE__);
    }
    Entry oEntry;
    oEntry.moNode.moFunction = oFunction;
    oEntry.moNode.moInputs = oInputs;
    oEntry.moNode.moOutputs = GetOutputIDs(1);
    oEntry.moNode.moDescription = oDescription;
    mvoEntries.push_back(std::move(oEntry));
    return mvoEntries.back().moNode.moOutputs.front();
}

const GenericProcessor::Node& GenericProcessor::GetNode(std::uint64_t nId) const
{
    RequireId(nId, "");
    return mvoEntries[nId].moNode;
}

/// "node 3 (Average filter [5, 7])"
std::string GenericProcessor::Describe(std::uint64_t nId) const
{
    const std::string& oText = mvoEntries[nId].moNode.moDescription;
    return "node " + std::to_string(nId) + (oText.empty() ? "" : " (" + oText + ")");
}

/// oReader says who wants it.
void GenericProcessor::RequireId(std::uint64_t nId, const std::string& oReader) const
{
    if (nId >= mvoEntries.size())
    {
        throw Exception("There is no node " + std::to_string(nId) +
                            (oReader.empty() ? "" : ", which " + oReader + " reads") +
                            "; the network has " + std::to_string(mvoEntries.size()) + " nodes",
                        kSource, __PRETTY_FUNCTION__, __LINE__);
    }
}

/// The nodes that have to run before a result is there, each behind those that it reads. Walks the
/// network without recursion: chains may be long.
std::vector<std::size_t> GenericProcessor::FindNeeded(std::uint64_t nId) const
{
    enum class Mark : unsigned char
    {
        eNew,
        eOpen,
        eClosed
    };
    struct Step
    {
        std::uint64_t mnId;
        std::size_t mnNextInput;
    };
    std::vector<Mark> veMarks(mvoEntries.size(), Mark::eNew);
    std::vector<std::size_t> vnNeeded;
    std::vector<Step> voPath;
    const auto oEnter = [&](std::uint64_t nNode)
    {
        if (veMarks[nNode] == Mark::eOpen)
        {
            throw Exception("The network has a cycle: " + Describe(nNode) + " needs its own result",
                            kSource, __PRETTY_FUNCTION__, __LINE__);
        }
        if (veMarks[nNode] == Mark::eNew && mvoEntries[nNode].moNode.mnState != eS_Done)
        {
            if (mvoEntries[nNode].moNode.mnState == eS_Failed)
            {
                std::rethrow_exception(mvoEntries[nNode].moFailure);
            }
            if (mvoEntries[nNode].moNode.mnState == eS_Released)
            {
                throw Exception("The result of " + Describe(nNode) +
                                    " was let go when the last node that read it had run",
                                kSource, __PRETTY_FUNCTION__, __LINE__);
            }
            veMarks[nNode] = Mark::eOpen;
            voPath.push_back({nNode, 0});
        }
    };
    RequireId(nId, "");
    oEnter(nId);
    while (!voPath.empty())
    {
        Step& oStep = voPath.back();
        const std::vector<std::uint64_t>& vnInputs = mvoEntries[oStep.mnId].moNode.moInputs;
        if (oStep.mnNextInput < vnInputs.size())
        {
            const std::uint64_t nInput = vnInputs[oStep.mnNextInput++];
            RequireId(nInput, Describe(oStep.mnId));
            oEnter(nInput);
            continue;
        }
        veMarks[oStep.mnId] = Mark::eClosed;
        vnNeeded.push_back(oStep.mnId);
        voPath.pop_back();
    }
    return vnNeeded;
}

boost::any GenericProcessor::Call(const Entry& oEntry)
{
    const std::vector<std::uint64_t>& vnInputs = oEntry.moNode.moInputs;
    if (vnInputs.size() == 1)
    {
        return oEntry.moNode.moFunction(mvoEntries[vnInputs.front()].moResult);
    }
    details::Arguments oArguments;
    for (const std::uint64_t nInput : vnInputs)
    {
        oArguments.push_back(boost::ref(mvoEntries[nInput].moResult));
    }
    boost::any oPacked(oArguments);
    return oEntry.moNode.moFunction(oPacked);
}

/// A node has run: results that nobody else is to read are let go.
void GenericProcessor::ReleaseInputs(const Entry& oEntry)
{
    for (const std::uint64_t nInput : oEntry.moNode.moInputs)
    {
        Entry& oRead = mvoEntries[nInput];
        if (--oRead.mnReaders == 0 && !oRead.mbKept)
        {
            oRead.moResult = boost::any();
            oRead.moNode.mnState = eS_Released;
        }
    }
}

/// One call of Evaluate: runs the nodes that are needed.
class GenericProcessor::Evaluation
{
public:
    Evaluation(GenericProcessor& oProcessor, std::vector<std::size_t> vnNeeded)
        : moProcessor(oProcessor), mvnNeeded(std::move(vnNeeded))
    {
        Prepare();
    }

    /// Runs them all; throws what the first one that failed threw.
    void Run()
    {
        // Without a team, a function has all threads for one of its own.
        [[maybe_unused]] const int nTeam = std::clamp(mnBranches, 1, OMPGetMaxThreads());
#pragma omp parallel num_threads(nTeam) if (nTeam > 1)
        Work();
        if (moFailure)
        {
            std::rethrow_exception(moFailure);
        }
    }

private:
    std::vector<Entry>& Entries()
    {
        return moProcessor.mvoEntries;
    }

    /// Counts who waits for whom, and how many nodes can run side by side.
    void Prepare()
    {
        for (Entry& oEntry : Entries())
        {
            oEntry.mnReaders = 0;
            oEntry.mnAwaited = 0;
            oEntry.mvnFollowers.clear();
        }
        for (const Entry& oEntry : Entries())
        {
            for (const std::uint64_t nInput : oEntry.moNode.moInputs)
            {
                if (oEntry.moNode.mnState == eS_Waiting && nInput < Entries().size())
                {
                    ++Entries()[nInput].mnReaders;
                }
            }
        }
        std::vector<std::size_t> vnLevels(Entries().size(), 0);
        std::vector<int> vnWidths(mvnNeeded.size() + 1, 0);
        for (const std::size_t nNode : mvnNeeded)
        {
            for (const std::uint64_t nInput : Entries()[nNode].moNode.moInputs)
            {
                if (Entries()[nInput].moNode.mnState != eS_Done)
                {
                    ++Entries()[nNode].mnAwaited;
                    Entries()[nInput].mvnFollowers.push_back(nNode);
                    vnLevels[nNode] = std::max(vnLevels[nNode], vnLevels[nInput] + 1);
                }
            }
            mnBranches = std::max(mnBranches, ++vnWidths[vnLevels[nNode]]);
            if (Entries()[nNode].mnAwaited == 0)
            {
                mvnReady.push_back(nNode);
            }
        }
        std::reverse(mvnReady.begin(), mvnReady.end());  // the last is taken first
        mvnReady.reserve(mvnNeeded.size());              // no allocation between threads
    }

    /// What each thread of the team does: runs nodes that are ready until there can be no more.
    /// Not tasks: beyond some number the runtime runs them at once, each inside the one that made
    /// it, and a long chain would fill the stack. No error leaves it.
    void Work()
    {
        std::unique_lock oLock(moMutex);
        while (true)
        {
            moChanged.wait(oLock,
                           [this] { return moFailure || mnRunning == 0 || !mvnReady.empty(); });
            if (moFailure || mvnReady.empty())
            {
                return;
            }
            Entry& oEntry = Entries()[mvnReady.back()];
            mvnReady.pop_back();
            ++mnRunning;
            oLock.unlock();
            boost::any oResult;
            const std::exception_ptr oFailure = CallNode(oEntry, oResult);
            oLock.lock();
            --mnRunning;
            Finish(oEntry, std::move(oResult), oFailure);
            moChanged.notify_all();
        }
    }

    /// Returns what the node's function threw, else null.
    std::exception_ptr CallNode(const Entry& oEntry, boost::any& oResult) const
    {
        try
        {
            oResult = moProcessor.Call(oEntry);
            return nullptr;
        }
        catch (...)
        {
            return std::current_exception();
        }
    }

    /// Keeps what came of a node, and makes ready those that waited for nothing else.
    void Finish(Entry& oEntry, boost::any oResult, const std::exception_ptr& oFailure)
    {
        if (oFailure)
        {
            oEntry.moNode.mnState = eS_Failed;
            oEntry.moFailure = oFailure;
            moFailure = moFailure ? moFailure : oFailure;
            return;
        }
        oEntry.moResult = std::move(oResult);
        oEntry.moNode.mnState = eS_Done;
        moProcessor.ReleaseInputs(oEntry);
        for (const std::size_t nFollower : oEntry.mvnFollowers)
        {
            if (--Entries()[nFollower].mnAwaited == 0)
            {
                mvnReady.push_back(nFollower);
            }
        }
    }

    GenericProcessor& moProcessor;
    std::vector<std::size_t> mvnNeeded;
    int mnBranches = 0;  ///< the most that can run side by side
    std::mutex moMutex;  ///< guards the entries and all below
    std::condition_variable moChanged;
    std::vector<std::size_t> mvnReady;  ///< those that wait for nothing, the next one last
    int mnRunning = 0;
    std::exception_ptr moFailure;
};

boost::any GenericProcessor::Evaluate(std::uint64_t nId)
{
    std::vector<std::size_t> vnNeeded = FindNeeded(nId);
    mvoEntries[nId].mbKept = true;
    Evaluation(*this, std::move(vnNeeded)).Run();
    return mvoEntries[nId].moResult;
}

}  // namespace kor
