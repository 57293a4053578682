#include "fen/osdep/OrvekPort.h"

#include "fen/osdep/RegKey.h"

namespace qv::fen::osdep {
namespace {

constexpr char16_t kOrvekKey[] = u"SOFTWARE\\Quorvane\\Orvek";

} // namespace

std::uint16_t GetOrvekDataPort()
{
    RegKey key(kLocalMachine, WString(kOrvekKey), false, true, u"");
    const auto stored = key.GetValue(u"DataPort");
    if (!stored) {
        RegValue value;
        value.type = kRegDword;
        value.number = kDefaultOrvekDataPort;
        key.SetValue(u"DataPort", value);
        return kDefaultOrvekDataPort;
    }
    if (stored->type != kRegDword || stored->number == 0 || stored->number > 65535)
        QV_THROW(exception::InvalidArgument());
    return static_cast<std::uint16_t>(stored->number);
}

WString GetOrvekDataBindAddress()
{
    RegKey key(kLocalMachine, WString(kOrvekKey), false, true, u"");
    const auto stored = key.GetValue(u"DataBindAddress");
    if (!stored || (stored->type != kRegSz && stored->type != kRegExpandSz))
        return WString();
    return WString(std::u16string_view(stored->text));
}

} // namespace qv::fen::osdep
