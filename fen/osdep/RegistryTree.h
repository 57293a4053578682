#pragma once
/// \file
/// The keys of one root of the registry store, held in memory: each key has
/// named values and subkeys, both kept in the order they were created and
/// with the letter case they were created with, and both looked up without
/// regard to case (in the current locale, as WString compares).

#include "fen/osdep/RegKey.h"

#include <string>
#include <string_view>
#include <vector>

namespace qv::fen::osdep::registry {

/// `text` folded for comparison: two names are the same name when their
/// folded forms are equal.
std::wstring FoldCase(std::u16string_view text);

/// Splits a key path at its backslashes. One trailing backslash is allowed
/// (a prefix ending in one followed by an empty subkey); an empty segment
/// elsewhere, or a name holding a control character or an unpaired
/// surrogate, throws WinError 161 (bad path name). The empty path names the root itself.
std::vector<std::u16string> SplitKeyPath(std::u16string_view path);

class StoredKey;

struct StoredValue {
    std::u16string name;
    std::wstring folded;
    RegValue value;
};

class StoredKey {
public:
    StoredKey() = default;
    explicit StoredKey(std::u16string_view name);

    const std::u16string& Name() const noexcept { return name_; }
    const std::vector<StoredValue>& Values() const noexcept { return values_; }
    const std::vector<StoredKey>& Subkeys() const noexcept { return subkeys_; }

    /// The key at `path` below this one; null when any key on the way is missing.
    const StoredKey* Find(const std::vector<std::u16string>& path) const;
    StoredKey* Find(const std::vector<std::u16string>& path);
    /// The key at `path` below this one, created with its missing parents;
    /// `created` tells whether anything was added.
    StoredKey& Obtain(const std::vector<std::u16string>& path, bool& created);
    /// Removes the direct subkey `name` with everything below it; false when
    /// there is none.
    bool RemoveSubkey(std::u16string_view name);

    const RegValue* FindValue(std::u16string_view name) const;
    /// Stores `value` under `name`, in place of any value of that name (whose
    /// position and spelling are kept); false when it held that value already.
    bool SetValue(std::u16string_view name, const RegValue& value);
    /// Removes the value `name`; false when there is none.
    bool RemoveValue(std::u16string_view name);

private:
    std::vector<StoredKey>::iterator FindSubkey(const std::wstring& folded);

    std::u16string name_;
    std::wstring folded_;
    std::vector<StoredValue> values_;
    std::vector<StoredKey> subkeys_;
};

} // namespace qv::fen::osdep::registry
