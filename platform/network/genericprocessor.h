#pragma once

#include <boost/any.hpp>
#include <boost/core/demangle.hpp>
#include <boost/function.hpp>
#include <boost/ref.hpp>
#include <cstdint>
#include <exception>
#include <memory>
#include <sstream>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "platform/exception/exception.h"

namespace kor
{

/// A network of functions that feed each other: a node takes the results of others, and gives one.
///
/// Evaluate runs what a node needs, each node once and never again. Branches that do not wait for
/// each other run on the threads of OpenMP; where there is one branch alone, its functions have all
/// threads to themselves. A result is let go when the last node that reads it has run, unless it
/// was asked for itself; values that the caller put in stay.
///
/// Errors   Evaluate throws kor::Exception for an id that no node has and for a cycle, before
///          anything runs, and for a result that was let go; else what the first function threw
///          that failed. Nothing is started after that; a node that failed throws the same again.
/// Threads  one object serves one thread at a time. The functions of nodes have to bear being
///          called on any thread, beside others.
class GenericProcessor
{
public:
    /// What GenericProcessor knows of a node.
    enum State : std::uint64_t
    {
        eS_Waiting = 0,
        eS_Done = 1,
        eS_Released = 2,  ///< has run, and its result was let go
        eS_Failed = 3
    };

    struct Node
    {
        boost::function<boost::any(boost::any&)> moFunction;  ///< empty for a value
        std::vector<std::uint64_t> moInputs;                  ///< in the order of the parameters
        std::vector<std::uint64_t> moOutputs;                 ///< one: the id of the node itself
        std::string moDescription;
        std::uint64_t mnState = eS_Waiting;  ///< a State
    };

    /// Makes a node's function of a functor, of which it holds a copy: takes the arguments of types
    /// A out of the any, calls the functor and puts its result, an R, into an any.
    template <class F, class R, class... A>
    class Function;

    /// A node with a result already. Returns its id.
    std::uint64_t AddValue(const boost::any& oValue, const std::string& oDescription = "");
    /// A node that reads those of oInputs, which may be added later. Its function gets the result
    /// itself where there is one input, else a vector of boost::reference_wrapper<boost::any>.
    /// Returns its id. Throws kor::Exception for an empty function.
    std::uint64_t Add(const boost::function<boost::any(boost::any&)>& oFunction,
                      const std::vector<std::uint64_t>& oInputs, const std::string& oDescription);

    boost::any Evaluate(std::uint64_t nId);

    /// Throws kor::Exception when there is none of that id.
    const Node& GetNode(std::uint64_t nId) const;
    std::size_t GetNodeCount() const { return mvoEntries.size(); }

private:
    /// A node with what evaluating it needs.
    struct Entry
    {
        Node moNode;
        boost::any moResult;
        std::exception_ptr moFailure;
        bool mbKept = false;        ///< the result is not let go
        std::size_t mnReaders = 0;  ///< inputs of nodes that are still to read the result
        std::size_t mnAwaited = 0;  ///< inputs whose results are still awaited
        std::vector<std::size_t> mvnFollowers;
    };

    class Evaluation;

    std::vector<std::uint64_t> GetOutputIDs(std::uint64_t nCount);
    void RequireId(std::uint64_t nId, const std::string& oReader) const;
    std::string Describe(std::uint64_t nId) const;
    std::vector<std::size_t> FindNeeded(std::uint64_t nId) const;
    boost::any Call(const Entry& oEntry);
    void ReleaseInputs(const Entry& oEntry);

    std::vector<Entry> mvoEntries;
    std::uint64_t mnNextId = 0;
};

namespace details
{

/// The argument of type A at position nIndex. Throws kor::Exception when the any holds another
/// type.
template <class A>
A ArgumentOf(boost::any& oValue, std::size_t nIndex)
{
    try
    {
        return boost::any_cast<A>(oValue);
    }
    catch (const boost::bad_any_cast&)
    {
        std::stringstream oMessage;
        // Two blanks behind "asking".
        oMessage << "Could not cast \"" << boost::core::demangle(oValue.type().name()) << "\" to \""
                 << boost::core::demangle(typeid(A).name()) << "\" for parameter " << nIndex + 1
                 << ".  Note that boost::any requires asking "
                 << " for the exact type, which means the parameter type of the "
                 << "dependent node's output must match the type of the current node's input";
        throw Exception(oMessage.str(), "", "", 0);
    }
}

using Arguments = std::vector<boost::reference_wrapper<boost::any>>;

/// The arguments of a node of several inputs. Throws kor::Exception when there are fewer than
/// nCount.
Arguments ArgumentsOf(boost::any& oValue, std::size_t nCount);

}  // namespace details

template <class F, class R, class... A>
class GenericProcessor::Function
{
public:
    explicit Function(F oFunctor) : moFunctor(std::move(oFunctor)) {}

    boost::any operator()(boost::any& oValue) const
    {
        if constexpr (sizeof...(A) == 1)
        {
            return boost::any(R(moFunctor(details::ArgumentOf<A>(oValue, 0)...)));
        }
        else
        {
            return Call(details::ArgumentsOf(oValue, sizeof...(A)),
                        std::index_sequence_for<A...>());
        }
    }

private:
    template <std::size_t... kIndex>
    boost::any Call(const details::Arguments& oArguments, std::index_sequence<kIndex...>) const
    {
        std::tuple<A...> oValues;
        // The last argument is cast first, so that of several wrong ones the last is told.
        constexpr std::size_t kLast = sizeof...(A) - 1;
        (Take<kLast - kIndex>(oArguments, oValues), ...);
        return boost::any(R(std::apply(moFunctor, std::move(oValues))));
    }

    template <std::size_t kIndex>
    static void Take(const details::Arguments& oArguments, std::tuple<A...>& oValues)
    {
        using Argument = std::tuple_element_t<kIndex, std::tuple<A...>>;
        std::get<kIndex>(oValues) = details::ArgumentOf<Argument>(oArguments[kIndex].get(), kIndex);
    }

    F moFunctor;
};

}  // namespace kor
