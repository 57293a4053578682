// Storage of a dictionary: values under keys, ordered by the keys' value
// order. Dictionaries compare entry by entry (key, then value), then by
// size; they read as a number by their entry count and as a logical by being
// non-empty. Their text is "{key: value, ...}" with each key and value in
// its own text form.

#include "value/VarData.h"
#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"

#include <cmath>
#include <cstdlib>
#include <cstring>
#include <map>
#include <new>
#include <string>

namespace qv::value::dynamic {
namespace {

/// The value order, except that a NaN key, which that order finds equal to
/// every number, sorts after the other numbers and equals only another NaN.
struct KeyLess {
    bool operator()(const VarData& a, const VarData& b) const
    {
        double x = 0.0;
        double y = 0.0;
        if (a.GetDouble(x) && b.GetDouble(y) && (std::isnan(x) || std::isnan(y)))
            return !std::isnan(x);
        return VarData::Compare(a, b) < 0;
    }
};

using Entries = std::map<VarData, VarData, KeyLess>;

std::u16string TextOf(const VarData& value)
{
    if (value.Code() == TypeCode::UnicodeString)
        return std::u16string(value.GetWString().View());
    VarData text(value);
    text.ConvertTo(TypeCode::UnicodeString);
    return std::u16string(text.GetWString().View());
}

class DictionaryGuts;

/// Walks the entries; holds a reference to the storage so that the entries
/// outlive any change of the value it came from.
class Iterator final : public IDictionaryIterator {
public:
    Iterator(const DictionaryGuts* owner, Entries::const_iterator position);

    void Destroy() override;
    const VarData* Value() const override { return &position_->second; }
    const VarData* Key() const override { return &position_->first; }
    void Advance() override { ++position_; }
    /// Iterators of two storages are equal only when both are past their
    /// last entry. A write during a walk gives the value new storage (the
    /// walk holds the old one), so a loop that tests against the value's End
    /// after each write still stops at the end of the entries it walks.
    bool Equals(const IDictionaryIterator* other) const override
    {
        const auto* that = static_cast<const Iterator*>(other);
        if (owner_ != that->owner_)
            return AtEnd() && that->AtEnd();
        return position_ == that->position_;
    }
    IDictionaryIterator* Copy() const override { return new Iterator(owner_, position_); }

private:
    bool AtEnd() const;

    const DictionaryGuts* owner_;
    Entries::const_iterator position_;
};

class DictionaryGuts final : public RefCounted<IDictionaryGuts> {
public:
    DictionaryGuts() = default;
    explicit DictionaryGuts(const Entries& entries) : entries_(entries) {}

    bool ToBool() const override { return !entries_.empty(); }
    double ToDouble() const override { return static_cast<double>(entries_.size()); }
    int Compare(const IGuts* other) const override
    {
        const Entries& those = static_cast<const DictionaryGuts*>(static_cast<const IDictionaryGuts*>(other))->entries_;
        auto mine = entries_.begin();
        auto theirs = those.begin();
        for (; mine != entries_.end() && theirs != those.end(); ++mine, ++theirs) {
            if (int c = VarData::Compare(mine->first, theirs->first); c != 0)
                return c;
            if (int c = VarData::Compare(mine->second, theirs->second); c != 0)
                return c;
        }
        return entries_.size() < those.size() ? -1 : (entries_.size() > those.size() ? 1 : 0);
    }
    const VarData* Find(const VarData& key) const override
    {
        auto found = entries_.find(key);
        return found == entries_.end() ? nullptr : &found->second;
    }
    VarData* Element(const VarData& key) override { return &entries_[key]; }
    IDictionaryIterator* Begin(const VarData&) const override { return new Iterator(this, entries_.begin()); }
    IDictionaryIterator* End(const VarData&) const override { return new Iterator(this, entries_.end()); }
    IDictionaryGuts* Copy() const override { return new DictionaryGuts(entries_); }
    char16_t* NewText() const override
    {
        std::u16string text = u"{";
        for (auto entry = entries_.begin(); entry != entries_.end(); ++entry) {
            if (entry != entries_.begin())
                text += u", ";
            text += TextOf(entry->first);
            text += u": ";
            text += TextOf(entry->second);
        }
        text += u"}";
        auto* buffer = static_cast<char16_t*>(std::malloc((text.size() + 1) * sizeof(char16_t)));
        if (buffer == nullptr)
            throw std::bad_alloc();
        std::memcpy(buffer, text.c_str(), (text.size() + 1) * sizeof(char16_t));
        return buffer;
    }
    std::uint32_t Count() const override { return static_cast<std::uint32_t>(entries_.size()); }

    bool IsEnd(Entries::const_iterator position) const { return position == entries_.end(); }
    void Hold() const { const_cast<DictionaryGuts*>(this)->AddRef(); }
    void Drop() const { const_cast<DictionaryGuts*>(this)->Release(); }

private:
    Entries entries_;
};

Iterator::Iterator(const DictionaryGuts* owner, Entries::const_iterator position)
    : owner_(owner), position_(position)
{
    owner_->Hold();
}

bool Iterator::AtEnd() const
{
    return owner_->IsEnd(position_);
}

void Iterator::Destroy()
{
    const DictionaryGuts* owner = owner_;
    delete this;
    owner->Drop();
}

} // namespace

IDictionaryGuts* NewVarDataDictionary()
{
    return new DictionaryGuts();
}

void wfd_free(void* text)
{
    std::free(text);
}

} // namespace qv::value::dynamic
