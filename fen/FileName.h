#pragma once
/// \file
/// The file-name part of a backslash-separated path.

#include "fen/String.h"

namespace qv::fen {

/// The text after the last backslash (the whole text when there is none);
/// a drive alone (one or two letters and a colon) gives the empty text.
WString FileNamePart(const WString& path);

} // namespace qv::fen
