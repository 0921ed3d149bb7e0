// SPDX-License-Identifier: MIT
// What a rewritten plug-in calls in place of its expressions. Each changed expression is a mutant with a number, and
// one mutant at most is on. Where the compiler needs a constant, none is.
#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <utility>

// In a library of their own, so that they stay when a plug-in's variables are set back.
extern "C" int netfloorMutant;
extern "C" unsigned char netfloorMutantReached[1 << 14];

namespace mutants {

template <int number>
constexpr bool on() {
    if (std::is_constant_evaluated()) {
        return false;
    }
    asm(".pushsection mutants, \"\", @progbits\n.long %c0\n.popsection" ::"i"(number)); // it is in the program
    netfloorMutantReached[number] = 1;
    return netfloorMutant == number;
}

// clang-format off
#define NETFLOOR_OPERATOR(Name, operation) \
    struct Name { \
        template <class L, class R> \
        constexpr auto operator()(L left, R right) const -> decltype(left operation right) { return left operation right; } \
    };
NETFLOOR_OPERATOR(Less, <)
NETFLOOR_OPERATOR(LessEqual, <=)
NETFLOOR_OPERATOR(Greater, >)
NETFLOOR_OPERATOR(GreaterEqual, >=)
NETFLOOR_OPERATOR(Equal, ==)
NETFLOOR_OPERATOR(NotEqual, !=)
NETFLOOR_OPERATOR(Plus, +)
NETFLOOR_OPERATOR(Minus, -)
NETFLOOR_OPERATOR(Times, *)
NETFLOOR_OPERATOR(Divide, /)
NETFLOOR_OPERATOR(Modulo, %)
NETFLOOR_OPERATOR(ShiftLeft, <<)
NETFLOOR_OPERATOR(ShiftRight, >>)
NETFLOOR_OPERATOR(BitAnd, &)
NETFLOOR_OPERATOR(BitOr, |)
NETFLOOR_OPERATOR(BitXor, ^)
#undef NETFLOOR_OPERATOR
// clang-format on

// The operation, or the one of the mutant that is on; `first` is the number of the first of them. Where an operation
// has no meaning for the types (the difference of two pointers as a sum), it is no mutant.
template <int first, class Operation, class... Changed, class L, class R>
constexpr auto apply(L left, R right) {
    using Result = std::invoke_result_t<Operation, L, R>;
    if (!std::is_constant_evaluated()) {
        Result result{};
        bool changed = false;
        const auto change = [&]<int mutant, class Change>() {
            if constexpr (std::is_invocable_v<Change, L, R>) {
                if (on<mutant>()) {
                    result = static_cast<Result>(Change{}(left, right));
                    changed = true;
                }
            }
        };
        [&]<int... index>(std::integer_sequence<int, index...>) {
            (..., change.template operator()<first + index, Changed>());
        }
        (std::make_integer_sequence<int, sizeof...(Changed)>());
        if (changed) {
            return result;
        }
    }
    return static_cast<Result>(Operation{}(left, right));
}

template <int mutant, class Number>
constexpr Number number(Number of) {
    return on<mutant>() ? static_cast<Number>(of + 1) : of;
}

} // namespace mutants
