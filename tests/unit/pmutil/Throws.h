// Checks of an exception's exact type and text.
#pragma once

#include <exception>
#include <stdexcept>
#include <string>
#include <typeinfo>

#include <gtest/gtest.h>

// Succeeds if `call` throws exactly a T, not a derived class, with the text `text`.
template <typename T, typename Call>
testing::AssertionResult ThrowsExactly(const std::string& text, Call call)
{
    try {
        call();
    } catch (const std::exception& error) {
        if (typeid(error) != typeid(T))
            return testing::AssertionFailure()
                   << "threw a " << typeid(error).name() << ": " << error.what();
        if (text != error.what())
            return testing::AssertionFailure() << "text is \"" << error.what() << "\"";
        return testing::AssertionSuccess();
    }
    return testing::AssertionFailure() << "threw nothing";
}

template <typename Call>
testing::AssertionResult ThrowsRuntimeError(const std::string& text, Call call)
{
    return ThrowsExactly<std::runtime_error>(text, call);
}

template <typename Call>
testing::AssertionResult ThrowsLogicError(const std::string& text, Call call)
{
    return ThrowsExactly<std::logic_error>(text, call);
}

template <typename Call>
testing::AssertionResult ThrowsInvalidArgument(const std::string& text, Call call)
{
    return ThrowsExactly<std::invalid_argument>(text, call);
}
