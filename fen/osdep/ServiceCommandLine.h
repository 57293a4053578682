#pragma once
/// \file
/// The command line of a service definition: variable references expanded
/// and the text split into arguments.
///
/// Words are separated by blanks. Inside double quotes blanks are kept and a
/// backslash escapes '"', '\\' and '$'; inside single quotes everything is
/// literal; outside quotes a backslash escapes the next character.
/// `${NAME}` and `%NAME%` (NAME of letters, digits and '_') are replaced by
/// the variable's value anywhere except inside single quotes; an unset
/// `${NAME}` is empty, an unset `%NAME%` stays as written. An expanded value
/// is never split, so a path with blanks stays one argument.

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace qv::fen::osdep {

using VariableLookup = std::function<std::optional<std::string>(const std::string& name)>;

/// The arguments of `commandLine`; an unclosed quote or `${` throws
/// InvalidArgument. Without `lookup` the process environment is used.
std::vector<std::string> SplitCommandLine(const std::string& commandLine, const VariableLookup& lookup = {});

} // namespace qv::fen::osdep
