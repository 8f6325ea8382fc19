/// Text as a template argument, so that names are put together by the compiler.
#pragma once

#include <cstddef>

namespace zsi {

/// A string of N - 1 characters and its terminating zero.
template <std::size_t N>
struct Text {
    char data[N]{};

    constexpr Text() = default;
    // Implicit, so that a literal can stand as a template argument.
    // cppcheck-suppress noExplicitConstructor
    constexpr Text(char const (&literal)[N])
    {
        for (std::size_t i = 0; i < N; ++i)
            data[i] = literal[i];
    }
};

template <std::size_t M, std::size_t N>
constexpr Text<M + N - 1> operator+(Text<M> const& a, Text<N> const& b)
{
    Text<M + N - 1> joined;
    for (std::size_t i = 0; i + 1 < M; ++i)
        joined.data[i] = a.data[i];
    for (std::size_t i = 0; i < N; ++i)
        joined.data[M - 1 + i] = b.data[i];
    return joined;
}

/// The characters of a text that is known at compile time; lives as long as the library.
template <Text kText>
inline constexpr auto kStoredText = kText;

} // namespace zsi
