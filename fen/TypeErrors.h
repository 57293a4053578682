#pragma once
/// \file
/// Exceptions outside the library's tree, derived straight from std::exception.

#include <exception>

/// A value was asked for as a type it does not hold.
class TypeErrorException : public std::exception {
public:
    const char* what() const noexcept override { return "VarData type error"; }
};

/// A dictionary key was not found. Nothing in the system throws it; the variant
/// interchange catches it so that a failing lookup can be reported by callers.
class KeyErrorException : public std::exception {};
