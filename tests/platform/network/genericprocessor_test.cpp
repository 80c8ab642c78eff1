#include "platform/network/genericprocessor.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <thread>

#include "tests/support/exceptions.h"
#include "tests/support/threads.h"

namespace kor
{
namespace
{

struct Sum
{
    int operator()(int a, int b) const { return a + b; }
};
struct Difference3
{
    double operator()(int a, double b, const std::string& o) const
    {
        return a - b - static_cast<double>(o.size());
    }
};
struct Twice
{
    int operator()(int a) const { return 2 * a; }
};

using SumNode = GenericProcessor::Function<Sum, int, int, int>;
using TwiceNode = GenericProcessor::Function<Twice, int, int>;
using DifferenceNode = GenericProcessor::Function<Difference3, double, int, double, std::string>;

int IntOf(const boost::any& oValue)
{
    return boost::any_cast<int>(oValue);
}

TEST(GenericProcessor, GivesTheArgumentsInTheOrderOfTheInputs)
{
    GenericProcessor oProcessor;
    const auto nText = oProcessor.AddValue(std::string("abc"));
    const auto nInt = oProcessor.AddValue(100, "a number");
    const auto nDouble = oProcessor.AddValue(0.5);
    const auto nNode =
        oProcessor.Add(DifferenceNode(Difference3()), {nInt, nDouble, nText}, "difference");
    EXPECT_EQ(boost::any_cast<double>(oProcessor.Evaluate(nNode)), 96.5);
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nInt)), 100);
}

TEST(GenericProcessor, KeepsTheRecordsOfItsNodes)
{
    GenericProcessor oProcessor;
    EXPECT_EQ(oProcessor.GetNodeCount(), 0U);
    const auto nValue = oProcessor.AddValue(1, "one");
    const auto nNode = oProcessor.Add(TwiceNode(Twice()), {nValue}, "doubled");
    EXPECT_EQ(oProcessor.GetNodeCount(), 2U);
    EXPECT_EQ(oProcessor.GetNode(nValue).moDescription, "one");
    EXPECT_EQ(oProcessor.GetNode(nNode).moDescription, "doubled");
    EXPECT_EQ(oProcessor.GetNode(nNode).moInputs, (std::vector<std::uint64_t>{nValue}));
    EXPECT_EQ(oProcessor.GetNode(nNode).moOutputs, (std::vector<std::uint64_t>{nNode}));
    EXPECT_EQ(oProcessor.GetNode(nNode).mnState, GenericProcessor::eS_Waiting);
    oProcessor.Evaluate(nNode);
    EXPECT_EQ(oProcessor.GetNode(nNode).mnState, GenericProcessor::eS_Done);
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.GetNode(2); }),
              "There is no node 2; the network has 2 nodes");
}

/// A function that counts its calls.
boost::function<boost::any(boost::any&)> Counting(std::atomic<int>& nCalls)
{
    return [&nCalls](boost::any&)
    {
        ++nCalls;
        return boost::any(7);
    };
}

TEST(GenericProcessor, RunsEachNodeOnceAndOnlyThoseThatAreNeeded)
{
    GenericProcessor oProcessor;
    std::atomic<int> nCalls = 0;
    std::atomic<int> nNeverCalled = 0;
    const auto nSource = oProcessor.Add(Counting(nCalls), {}, "");
    oProcessor.Add(Counting(nNeverCalled), {nSource}, "");
    const auto nLeft = oProcessor.Add(TwiceNode(Twice()), {nSource}, "");
    const auto nRight = oProcessor.Add(TwiceNode(Twice()), {nSource}, "");
    const auto nEnd = oProcessor.Add(SumNode(Sum()), {nLeft, nRight}, "");
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nEnd)), 28);
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nEnd)), 28);
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nSource)), 7);  // one reader has not run yet
    EXPECT_EQ(nCalls, 1);
    EXPECT_EQ(nNeverCalled, 0);
}

TEST(GenericProcessor, LetsAResultGoWhenItsLastReaderHasRun)
{
    GenericProcessor oProcessor;
    const auto pValue = std::make_shared<int>(1);
    std::weak_ptr<int> pMade;
    const auto nSource = oProcessor.Add(
        [&](boost::any&)
        {
            const auto pFresh = std::make_shared<int>(5);
            pMade = pFresh;
            return boost::any(pFresh);
        },
        {}, "source");
    const auto oRead = [](boost::any& oValue)
    { return boost::any(*boost::any_cast<std::shared_ptr<int>>(oValue)); };
    const auto nOne = oProcessor.Add(oRead, {nSource}, "");
    const auto nOther = oProcessor.Add(oRead, {nSource}, "");
    const auto nGiven = oProcessor.AddValue(pValue);
    const auto nOfGiven = oProcessor.Add(oRead, {nGiven}, "");

    EXPECT_EQ(IntOf(oProcessor.Evaluate(nOne)), 5);
    EXPECT_FALSE(pMade.expired());
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nOther)), 5);
    EXPECT_TRUE(pMade.expired());
    EXPECT_EQ(oProcessor.GetNode(nSource).mnState, GenericProcessor::eS_Released);
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Evaluate(nSource); }),
              "The result of node 0 (source) was let go when the last node that read it had run");

    EXPECT_EQ(IntOf(oProcessor.Evaluate(nOfGiven)), 1);
    EXPECT_EQ(pValue.use_count(), 2);  // what the caller put in stays
}

TEST(GenericProcessor, KeepsAResultThatWasAskedFor)
{
    GenericProcessor oProcessor;
    std::atomic<int> nCalls = 0;
    const auto nSource = oProcessor.Add(Counting(nCalls), {}, "");
    oProcessor.Evaluate(nSource);
    const auto nEnd = oProcessor.Add(TwiceNode(Twice()), {nSource}, "");
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nEnd)), 14);
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nSource)), 7);
    EXPECT_EQ(nCalls, 1);
}

TEST(GenericProcessor, RefusesMissingNodesAndCyclesBeforeAnythingRuns)
{
    GenericProcessor oProcessor;
    std::atomic<int> nCalls = 0;
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Evaluate(0); }),
              "There is no node 0; the network has 0 nodes");
    const auto nSource = oProcessor.Add(Counting(nCalls), {}, "");
    const auto nMissing = oProcessor.Add(SumNode(Sum()), {nSource, 99}, "sum");
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Evaluate(nMissing); }),
              "There is no node 99, which node 1 (sum) reads; the network has 2 nodes");
    const auto nItself = oProcessor.Add(TwiceNode(Twice()), {2}, "");
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Evaluate(nItself); }),
              "The network has a cycle: node 2 needs its own result");
    oProcessor.Add(SumNode(Sum()), {nSource, 4}, "first");
    oProcessor.Add(TwiceNode(Twice()), {3}, "second");
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Evaluate(4); }),
              "The network has a cycle: node 4 (second) needs its own result");
    EXPECT_EQ(nCalls, 0);
}

TEST(GenericProcessor, RefusesAnEmptyFunction)
{
    GenericProcessor oProcessor;
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Add({}, {}, "nothing"); }),
              "oFunction is empty");
    EXPECT_EQ(oProcessor.GetNodeCount(), 0U);
}

TEST(GenericProcessor, ReadsNodesThatAreAddedLater)
{
    GenericProcessor oProcessor;
    const auto nNode = oProcessor.Add(TwiceNode(Twice()), {1}, "");
    oProcessor.AddValue(21);
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nNode)), 42);
}

TEST(GenericProcessor, RunsIndependentBranchesOnSeveralThreads)
{
    const test::ThreadCount oThreads(2);
    GenericProcessor oProcessor;
    // Each branch waits until the other has begun: on one thread, neither would.
    std::atomic<int> nBegun = 0;
    const auto oMeet = [&](boost::any&)
    {
        ++nBegun;
        const auto oEnd = std::chrono::steady_clock::now() + std::chrono::seconds(20);
        while (nBegun < 2 && std::chrono::steady_clock::now() < oEnd)
        {
            std::this_thread::yield();
        }
        return boost::any(nBegun == 2 ? 1 : 0);
    };
    const auto nOne = oProcessor.Add(oMeet, {}, "");
    const auto nOther = oProcessor.Add(oMeet, {}, "");
    const auto nEnd = oProcessor.Add(SumNode(Sum()), {nOne, nOther}, "");
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nEnd)), 2);
}

TEST(GenericProcessor, RunsLongChainsAndWideNetworks)
{
    const test::ThreadCount oThreads(3);
    GenericProcessor oProcessor;
    const auto oAddOne = [](boost::any& oValue) { return boost::any(IntOf(oValue) + 1); };
    std::uint64_t nLast = oProcessor.AddValue(0);
    for (int i = 0; i < 100000; ++i)
    {
        nLast = oProcessor.Add(oAddOne, {nLast}, "");
    }
    EXPECT_EQ(IntOf(oProcessor.Evaluate(nLast)), 100000);

    std::vector<std::uint64_t> vnBranches;
    for (int i = 0; i < 1000; ++i)
    {
        vnBranches.push_back(oProcessor.Add(oAddOne, {oProcessor.AddValue(i)}, ""));
    }
    const auto oSumUp = [](boost::any& oValue)
    {
        int nSum = 0;
        for (const auto& oPart : boost::any_cast<details::Arguments&>(oValue))
        {
            nSum += IntOf(oPart.get());
        }
        return boost::any(nSum);
    };
    EXPECT_EQ(IntOf(oProcessor.Evaluate(oProcessor.Add(oSumUp, vnBranches, ""))), 500500);
}

// Nodes of a chain that each feed a side branch too, when many others are ready already: how deep
// the network is must not count for the stack.
TEST(GenericProcessor, RunsLongChainsWithSideBranchesBesideManyOthers)
{
    for (const int nThreads : {1, 3})
    {
        const test::ThreadCount oThreads(nThreads);
        GenericProcessor oProcessor;
        const auto oOne = [](boost::any&) { return boost::any(1); };
        const auto oAddOne = [](boost::any& oValue) { return boost::any(IntOf(oValue) + 1); };
        std::vector<std::uint64_t> vnBranches;
        for (int i = 0; i < 1000; ++i)
        {
            vnBranches.push_back(oProcessor.Add(oOne, {}, ""));
        }
        std::uint64_t nLast = oProcessor.Add(oOne, {}, "");
        for (int i = 0; i < 50000; ++i)
        {
            nLast = oProcessor.Add(oAddOne, {nLast}, "");
            vnBranches.push_back(oProcessor.Add(oAddOne, {nLast}, ""));
        }
        const auto oLargest = [](boost::any& oValue)
        {
            int nLargest = 0;
            for (const auto& oPart : boost::any_cast<details::Arguments&>(oValue))
            {
                nLargest = std::max(nLargest, IntOf(oPart.get()));
            }
            return boost::any(nLargest);
        };
        EXPECT_EQ(IntOf(oProcessor.Evaluate(oProcessor.Add(oLargest, vnBranches, ""))), 50002);
    }
}

TEST(GenericProcessor, PassesOnWhatAFunctionThrowsAndStartsNothingBehindIt)
{
    GenericProcessor oProcessor;
    std::atomic<int> nTries = 0;
    std::atomic<int> nBehind = 0;
    const auto nBad = oProcessor.Add(
        [&](boost::any&) -> boost::any
        {
            ++nTries;
            throw DataException("no data", "", "", 0);
        },
        {}, "");
    const auto nEnd = oProcessor.Add(Counting(nBehind), {nBad}, "");
    for (int i = 0; i < 2; ++i)
    {
        EXPECT_EQ(test::MessageOf<DataException>([&] { oProcessor.Evaluate(nEnd); }), "no data");
    }
    EXPECT_EQ(nTries, 1);
    EXPECT_EQ(nBehind, 0);
    EXPECT_EQ(oProcessor.GetNode(nBad).mnState, GenericProcessor::eS_Failed);
    EXPECT_EQ(oProcessor.GetNode(nEnd).mnState, GenericProcessor::eS_Waiting);
}

TEST(GenericProcessor, SaysHowManyArgumentsWereExpected)
{
    GenericProcessor oProcessor;
    const auto nValue = oProcessor.AddValue(1);
    const auto nNode = oProcessor.Add(DifferenceNode(Difference3()), {nValue}, "");
    try
    {
        oProcessor.Evaluate(nNode);
        FAIL() << "nothing was thrown";
    }
    catch (const Exception& oError)
    {
        EXPECT_EQ(oError.GetMessage(), "Node expected 3 arguments but only received 1");
        EXPECT_EQ(oError.GetFile(), "");
        EXPECT_EQ(oError.GetFunction(), "");
        EXPECT_EQ(oError.GetLine(), 0U);
    }
    const auto nTwo = oProcessor.Add(DifferenceNode(Difference3()), {nValue, nValue}, "");
    EXPECT_EQ(test::MessageOf<Exception>([&] { oProcessor.Evaluate(nTwo); }),
              "Node expected 3 arguments but only received 2");
}

TEST(GenericProcessor, SaysWhichArgumentHasAnotherTypeTheLastOneFirst)
{
    GenericProcessor oProcessor;
    const auto nInt = oProcessor.AddValue(1);
    const auto nDouble = oProcessor.AddValue(1.0);
    const auto oMessage = [&](const boost::function<boost::any(boost::any&)>& oFunction,
                              const std::vector<std::uint64_t>& vnInputs)
    {
        const auto nNode = oProcessor.Add(oFunction, vnInputs, "");
        return test::MessageOf<Exception>([&] { oProcessor.Evaluate(nNode); });
    };
    constexpr const char* kRest =
        ".  Note that boost::any requires asking  for the exact type, which means the parameter "
        "type of the dependent node's output must match the type of the current node's input";
    EXPECT_EQ(oMessage(SumNode(Sum()), {nDouble, nInt}),
              std::string("Could not cast \"double\" to \"int\" for parameter 1") + kRest);
    EXPECT_EQ(oMessage(SumNode(Sum()), {nDouble, nDouble}),
              std::string("Could not cast \"double\" to \"int\" for parameter 2") + kRest);
    EXPECT_EQ(oMessage(TwiceNode(Twice()), {nDouble}),
              std::string("Could not cast \"double\" to \"int\" for parameter 1") + kRest);
}

}  // namespace
}  // namespace kor
