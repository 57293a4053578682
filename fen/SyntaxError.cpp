#include "fen/SyntaxError.h"

namespace qv::fen::exception {

SyntaxError::SyntaxError(const WString& detail)
    : message_(detail.empty() ? String("SyntaxError") : String("SyntaxError: ") + String(detail))
{
}

} // namespace qv::fen::exception
