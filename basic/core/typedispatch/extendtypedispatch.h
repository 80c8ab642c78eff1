#pragma once

#include <vector>

#include "basic/core/typedispatch/typelist.h"
#include "platform/exception/exception.h"

namespace kor::typedispatch
{

/// Makes Product<T1, T2> by default construction and gives it as Interface*; the caller owns it.
template <template <class, class> class ProductTemplate, class InterfaceType>
struct Factory2Template
{
    using Interface = InterfaceType;
    template <class T1, class T2>
    using Product = ProductTemplate<T1, T2>;

    template <class T1, class T2>
    static Interface* Create()
    {
        return new Product<T1, T2>();
    }
};

/// The same for products of one type.
template <template <class> class ProductTemplate, class InterfaceType>
struct Factory1Template
{
    using Interface = InterfaceType;
    template <class T1>
    using Product = ProductTemplate<T1>;

    template <class T1>
    static Interface* Create()
    {
        return new Product<T1>();
    }
};

/// The bridge from run-time data types to the one template instance that works on them, for any
/// number of dimensions. N dimensions are open; ListA are the types tried in this one, ListB those
/// of the next; Chosen are the types that are fixed already, the last dimension's last.
///
/// Start with N = 2, StandardTypeList twice and typeconv::priv::NullDataType, and oTypes {input,
/// output}. The last element of oTypes is looked at first. With bExtendComplex a complex type
/// stands for the type of its parts. The caller owns the product.
///
/// Throws kor::Exception "Not enough type in the vector for the dispatcher you are using." and
/// "Invalid type requested.".
template <class Factory, int N, class ListA, class ListB, class Chosen>
class ExtendDispatchTypes
{
public:
    using Interface = typename Factory::Interface;

    static Interface* Dispatch(const std::vector<tessel::DataType>& oTypes, bool bExtendComplex)
    {
        static_assert(N >= 1);
        const char* const pszFunction = __PRETTY_FUNCTION__;
        if (oTypes.size() < static_cast<std::size_t>(N))
        {
            constexpr bool bLastOfList =
                std::is_same_v<typename ListA::Tail, typeconv::priv::NullDataType>;
            throw Exception("Not enough type in the vector for the dispatcher you are using.",
                            kSource, pszFunction, bLastOfList ? 163 : 114);
        }
        const auto oNone = [pszFunction]() -> Interface*
        { throw Exception("Invalid type requested.", kSource, pszFunction, 175); };
        const auto oVisit = [&]<class T>() -> Interface*
        {
            using Fixed = typeconv::priv::TypeList<T, Chosen>;
            if constexpr (N == 1)
            {
                return Create(Fixed());
            }
            else
            {
                return ExtendDispatchTypes<Factory, N - 1, ListB, ListB, Fixed>::Dispatch(
                    oTypes, bExtendComplex);
            }
        };
        return VisitType<ListA>(FindDataType<ListA>(oTypes[N - 1], bExtendComplex), oVisit, oNone);
    }

private:
    static constexpr const char* kSource = "basic/core/typedispatch/extendtypedispatch";

    template <class Head, class Tail, class... Front>
    static Interface* Create(typeconv::priv::TypeList<Head, Tail>, Front*... apFront)
    {
        return Create(Tail(), apFront..., static_cast<Head*>(nullptr));
    }

    template <class... All>
    static Interface* Create(typeconv::priv::NullDataType, All*...)
    {
        return Factory::template Create<All...>();
    }
};

/// The usual call: the product of the input's and the output's type.
template <class Factory>
typename Factory::Interface* DispatchTypePair(const tessel::DataType& oIn,
                                              const tessel::DataType& oOut, bool bExtendComplex)
{
    return ExtendDispatchTypes<Factory, 2, StandardTypeList, StandardTypeList,
                               typeconv::priv::NullDataType>::Dispatch({oIn, oOut}, bExtendComplex);
}

}  // namespace kor::typedispatch
