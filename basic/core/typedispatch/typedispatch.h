#pragma once

#include <memory>

#include "basic/core/typedispatch/typelist.h"
#include "platform/exception/exception.h"

namespace kor::typedispatch
{

namespace details
{

inline constexpr const char* kTypeDispatchSource = "basic/core/typedispatch/typedispatch";

/// Second step of the two-type dispatch: finds the output type, real or complex, and returns
/// Policy::Create<TIn, TOut>(). Throws kor::Exception "Invalid type to dispatch.".
template <class TIn, class ListOut, class Policy>
class OutputDispatchType
{
public:
    using Product = decltype(Policy::template Create<TIn, typename ListOut::Head>());

    static Product Dispatch(const tessel::DataType& oOut)
    {
        const char* const pszFunction = __PRETTY_FUNCTION__;
        return VisitType<ListOut>(
            FindDataType<ListOut>(oOut, true),
            []<class TOut>() -> Product { return Policy::template Create<TIn, TOut>(); },
            [pszFunction]() -> Product {
                throw Exception("Invalid type to dispatch.", kTypeDispatchSource, pszFunction, 375);
            });
    }
};

/// First step of the two-type dispatch: finds the input type, real or complex. The caller owns the
/// result. Throws kor::Exception "Invalid type to dispatch.".
template <class ListIn, class ListOut, class Policy>
class InputDispatchType
{
public:
    using Product = typename OutputDispatchType<typename ListIn::Head, ListOut, Policy>::Product;

    static Product Dispatch(const tessel::DataType& oIn, const tessel::DataType& oOut)
    {
        const char* const pszFunction = __PRETTY_FUNCTION__;
        return VisitType<ListIn>(
            FindDataType<ListIn>(oIn, true),
            [&oOut]<class TIn>() -> Product
            { return OutputDispatchType<TIn, ListOut, Policy>::Dispatch(oOut); },
            [pszFunction]() -> Product {
                throw Exception("Invalid type to dispatch.", kTypeDispatchSource, pszFunction, 443);
            });
    }
};

}  // namespace details

/// A conversion of nCount consecutive elements.
class IConvertTo
{
public:
    virtual void operator()(const void* pIn, void* pOut, std::size_t nCount) = 0;
    virtual ~IConvertTo() = default;
};

/// Element types by NativeDataType code, 0 to 9.
using NativeTypeList =
    typeconv::priv::MakeTypeList<unsigned char, char, unsigned short, short, unsigned int, int,
                                 float, uint64, int64, double>::Type;

/// Dispatch of a family of conversions Op<TIn, TOut> by NativeDataType code. Complex types stand
/// for the type of their parts, so that no conversion is made for them: the caller doubles the
/// count.
template <template <class, class> class Op>
class DualDispatch
{
public:
    /// First stage: the input type is fixed. Owns the second stage and forwards to it.
    template <class T1>
    class FirstDataTypeHolder : public IConvertTo
    {
    public:
        /// Base of Op<T1, T2>.
        template <class T2>
        class AssignSecondDataType : public IConvertTo
        {
        };

        explicit FirstDataTypeHolder(const tessel::DataType& oOut)
            : mpoSecond(VisitType<NativeTypeList>(
                  NativeCode(oOut), []<class T2>() -> IConvertTo* { return new Op<T1, T2>(); },
                  []() -> IConvertTo* { return nullptr; }))
        {
        }

        bool IsComplete() const { return mpoSecond != nullptr; }
        void operator()(const void* pIn, void* pOut, std::size_t nCount) override
        {
            (*mpoSecond)(pIn, pOut, nCount);
        }

    private:
        std::unique_ptr<IConvertTo> mpoSecond;
    };

    /// The conversion for a pair of types, which the caller owns; null for a type without elements
    /// (eDT_BIT, unsigned floats).
    static IConvertTo* Create(const tessel::DataType& oIn, const tessel::DataType& oOut);

private:
    static std::size_t NativeCode(const tessel::DataType& oType)
    {
        return tessel::NativeDataType(oType.mbComplex ? tessel::RealPartType(oType) : oType).mnCode;
    }
};

// Outside the class and so not inline: a family that is declared extern is compiled once.
template <template <class, class> class Op>
IConvertTo* DualDispatch<Op>::Create(const tessel::DataType& oIn, const tessel::DataType& oOut)
{
    return VisitType<NativeTypeList>(
        NativeCode(oIn),
        [&oOut]<class T1>() -> IConvertTo*
        {
            auto poHolder = std::make_unique<FirstDataTypeHolder<T1>>(oOut);
            return poHolder->IsComplete() ? poHolder.release() : nullptr;
        },
        []() -> IConvertTo* { return nullptr; });
}

}  // namespace kor::typedispatch
