#include "fen/osdep/RegistryTree.h"

#include "fen/osdep/OSException.h"

#include <algorithm>
#include <cwctype>

namespace qv::fen::osdep::registry {
namespace {

constexpr std::uint32_t kErrorBadPathName = 161;

/// Key names are written verbatim into the store's section lines, so they
/// may hold neither control characters nor text that is not valid UTF-16.
bool IsPrintableName(std::u16string_view name)
{
    for (std::size_t i = 0; i < name.size(); ++i) {
        const char16_t c = name[i];
        if (c < 0x20 || c == 0x7F || (c >= 0xDC00 && c < 0xE000))
            return false;
        if (c >= 0xD800 && c < 0xDC00) {
            if (i + 1 == name.size() || name[i + 1] < 0xDC00 || name[i + 1] >= 0xE000)
                return false;
            ++i;
        }
    }
    return true;
}

} // namespace

std::wstring FoldCase(std::u16string_view text)
{
    // The same folding as WString's comparison: code points (a lone
    // surrogate stands for itself) lowered with towlower.
    std::wstring folded;
    folded.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t c = text[i];
        if (c >= 0xD800 && c < 0xDC00 && i + 1 < text.size() && text[i + 1] >= 0xDC00 && text[i + 1] < 0xE000) {
            c = 0x10000 + ((c - 0xD800) << 10) + (text[i + 1] - 0xDC00);
            ++i;
        }
        folded.push_back(static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c))));
    }
    return folded;
}

std::vector<std::u16string> SplitKeyPath(std::u16string_view path)
{
    std::vector<std::u16string> segments;
    if (path.empty())
        return segments;
    if (path.back() == u'\\')
        path.remove_suffix(1);
    for (;;) {
        const std::size_t end = path.find(u'\\');
        const std::u16string_view segment = path.substr(0, end);
        if (segment.empty() || !IsPrintableName(segment))
            QV_THROW(WinError(String("Invalid registry key path: an empty key name, a control character "
                                     "or an unpaired surrogate"),
                              kErrorBadPathName));
        segments.emplace_back(segment);
        if (end == std::u16string_view::npos)
            return segments;
        path.remove_prefix(end + 1);
    }
}

StoredKey::StoredKey(std::u16string_view name) : name_(name), folded_(FoldCase(name)) {}

std::vector<StoredKey>::iterator StoredKey::FindSubkey(const std::wstring& folded)
{
    return std::find_if(subkeys_.begin(), subkeys_.end(),
                        [&](const StoredKey& key) { return key.folded_ == folded; });
}

const StoredKey* StoredKey::Find(const std::vector<std::u16string>& path) const
{
    return const_cast<StoredKey*>(this)->Find(path);
}

StoredKey* StoredKey::Find(const std::vector<std::u16string>& path)
{
    StoredKey* key = this;
    for (const std::u16string& name : path) {
        auto found = key->FindSubkey(FoldCase(name));
        if (found == key->subkeys_.end())
            return nullptr;
        key = &*found;
    }
    return key;
}

StoredKey& StoredKey::Obtain(const std::vector<std::u16string>& path, bool& created)
{
    created = false;
    StoredKey* key = this;
    for (const std::u16string& name : path) {
        auto found = key->FindSubkey(FoldCase(name));
        if (found == key->subkeys_.end()) {
            key->subkeys_.emplace_back(name);
            created = true;
            key = &key->subkeys_.back();
        } else {
            key = &*found;
        }
    }
    return *key;
}

bool StoredKey::RemoveSubkey(std::u16string_view name)
{
    auto found = FindSubkey(FoldCase(name));
    if (found == subkeys_.end())
        return false;
    subkeys_.erase(found);
    return true;
}

const RegValue* StoredKey::FindValue(std::u16string_view name) const
{
    const std::wstring folded = FoldCase(name);
    for (const StoredValue& value : values_)
        if (value.folded == folded)
            return &value.value;
    return nullptr;
}

bool StoredKey::SetValue(std::u16string_view name, const RegValue& value)
{
    if (RegValue* existing = const_cast<RegValue*>(FindValue(name))) {
        if (*existing == value)
            return false;
        *existing = value;
        return true;
    }
    values_.push_back(StoredValue{std::u16string(name), FoldCase(name), value});
    return true;
}

bool StoredKey::RemoveValue(std::u16string_view name)
{
    const std::wstring folded = FoldCase(name);
    auto found = std::find_if(values_.begin(), values_.end(),
                              [&](const StoredValue& value) { return value.folded == folded; });
    if (found == values_.end())
        return false;
    values_.erase(found);
    return true;
}

} // namespace qv::fen::osdep::registry
