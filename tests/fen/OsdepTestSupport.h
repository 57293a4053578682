#pragma once
// Helpers of the tests of the settings files: a file's bytes, and short ways
// to write the registry values that the tests store and expect.

#include "fen/osdep/RegKey.h"

#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

inline std::string ReadBytes(const std::string& file)
{
    std::ifstream in(file, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

inline void WriteBytes(const std::string& file, const std::string& bytes)
{
    std::ofstream(file, std::ios::binary) << bytes;
}

using qv::fen::osdep::RegValue;

inline RegValue Sz(std::u16string text, std::uint32_t type = qv::fen::osdep::kRegSz)
{
    RegValue value;
    value.type = type;
    value.text = std::move(text);
    return value;
}
inline RegValue MultiSz(std::vector<std::u16string> list)
{
    RegValue value = Sz(u"", qv::fen::osdep::kRegMultiSz);
    value.list = std::move(list);
    return value;
}
inline RegValue Number(std::uint32_t type, std::uint64_t number)
{
    RegValue value = Sz(u"", type);
    value.number = number;
    return value;
}
inline RegValue Bytes(std::uint32_t type, std::vector<std::uint8_t> bytes)
{
    RegValue value = Sz(u"", type);
    value.bytes = std::move(bytes);
    return value;
}
