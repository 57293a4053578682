#pragma once
/// \file
/// The allocation failure of the library's storage: a std::bad_alloc whose
/// text is "bad allocation", so every catch of std::bad_alloc still sees it.

#include <new>

namespace qv::fen {

class BadAllocation : public std::bad_alloc {
public:
    const char* what() const noexcept override { return "bad allocation"; }
};

} // namespace qv::fen
