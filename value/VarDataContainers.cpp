// Vectors and dictionaries inside VarData, with copy on write.

#include "value/VarData.h"

#include "fen/TypeErrors.h"
#include "value/GutsAccess.h"
#include "value/dynamic/DynamicData.h"

namespace qv::value {

using namespace dynamic;

void VarData::MakeUnshared()
{
    IGuts* guts = Guts();
    if (guts == nullptr)
        return;
    guts->AddRef();
    if (guts->Release() <= 1)
        return;
    IGuts* copy = nullptr;
    if ((type_ & kVectorBit) != 0)
        copy = static_cast<IVectorGuts*>(guts)->Copy();
    else if (Code() == TypeCode::Dictionary)
        copy = static_cast<IDictionaryGuts*>(guts)->Copy();
    else
        return;
    payload_.guts = copy;
    guts->Release();
}

VarData& VarData::operator[](const VarData& key)
{
    if (Code() != TypeCode::Dictionary)
        throw TypeErrorException();
    if (payload_.guts == nullptr)
        payload_.guts = NewVarDataDictionary(); // a dictionary value without storage is empty
    MakeUnshared();
    return *static_cast<IDictionaryGuts*>(payload_.guts)->Element(key);
}

const VarData* VarData::Find(const VarData& key) const
{
    if (Code() != TypeCode::Dictionary)
        throw TypeErrorException();
    if (payload_.guts == nullptr)
        return nullptr;
    return static_cast<const IDictionaryGuts*>(payload_.guts)->Find(key);
}

DictionaryIterator VarData::Begin() const
{
    if (Code() != TypeCode::Dictionary)
        throw TypeErrorException();
    if (payload_.guts == nullptr)
        return DictionaryIterator(nullptr);
    return DictionaryIterator(static_cast<const IDictionaryGuts*>(payload_.guts)->Begin(*this));
}

DictionaryIterator VarData::End() const
{
    if (Code() != TypeCode::Dictionary)
        throw TypeErrorException();
    if (payload_.guts == nullptr)
        return DictionaryIterator(nullptr);
    return DictionaryIterator(static_cast<const IDictionaryGuts*>(payload_.guts)->End(*this));
}

VarData VarData::GetElement(std::uint32_t index) const
{
    VarData element = MakeTyped(TypeCode::Null);
    if ((type_ & kVectorBit) == 0 || payload_.guts == nullptr)
        return element;
    Interface<IVectorElements> elements(payload_.guts, kIID_VectorElements);
    if (elements)
        elements->GetElement(&element, index);
    return element;
}

void VarData::SetElement(std::uint32_t index, const VarData& value)
{
    // `value` may be this very value or share its storage: take it first.
    VarData element(value);
    if ((type_ & kVectorBit) == 0 || payload_.guts == nullptr) {
        IVectorGuts* vector = NewVectorGuts();
        try {
            vector->SetElement(0, *this);
        } catch (...) {
            vector->Release();
            throw;
        }
        ReleaseStorage();
        type_ = TypeCode::Vector;
        payload_.count = 0;
        payload_.guts = vector;
    }
    MakeUnshared();
    static_cast<IVectorGuts*>(payload_.guts)->SetElement(index, std::move(element));
}

int VarData::Compare(const VarData& a, const VarData& b)
{
    const int codeA = a.Code();
    const int codeB = b.Code();
    if (codeA != codeB)
        return codeA - codeB;
    auto sign = [](auto x, auto y) { return x < y ? -1 : (y < x ? 1 : 0); };
    switch (codeA) {
    case TypeCode::Empty:
    case TypeCode::Null:
    case TypeCode::CairnetBreak:
    case TypeCode::LogicalPulse: return 0;
    case TypeCode::Logical: return int{a.payload_.logical} - int{b.payload_.logical};
    case TypeCode::Numeric: {
        const double difference = a.payload_.number - b.payload_.number;
        return difference > 0.0 ? 1 : (difference < 0.0 ? -1 : 0); // NaN gives 0
    }
    case TypeCode::Time:
    case TypeCode::UInt64: return sign(a.payload_.count, b.payload_.count);
    default: break;
    }
    if ((codeA & kStorageBit) == 0)
        return sign(a.payload_.words[0], b.payload_.words[0]);
    IGuts* guts = a.payload_.guts;
    IGuts* other = b.payload_.guts;
    if (guts == other)
        return 0;
    if (guts != nullptr && other != nullptr)
        return guts->Compare(other);
    return guts == nullptr ? -1 : 1;
}

DictionaryIterator::DictionaryIterator(const DictionaryIterator& other)
    : iterator_(other.iterator_ != nullptr ? other.iterator_->Copy() : nullptr)
{
}

DictionaryIterator& DictionaryIterator::operator=(const DictionaryIterator& other)
{
    if (this != &other) {
        IDictionaryIterator* copy = other.iterator_ != nullptr ? other.iterator_->Copy() : nullptr;
        if (iterator_ != nullptr)
            iterator_->Destroy();
        iterator_ = copy;
    }
    return *this;
}

DictionaryIterator::~DictionaryIterator()
{
    if (iterator_ != nullptr)
        iterator_->Destroy();
}

bool operator!=(const DictionaryIterator& a, const DictionaryIterator& b)
{
    if (a.iterator_ == nullptr || b.iterator_ == nullptr)
        return a.iterator_ != b.iterator_;
    return !a.iterator_->Equals(b.iterator_);
}

DictionaryIterator& DictionaryIterator::operator++()
{
    if (iterator_ != nullptr)
        iterator_->Advance();
    return *this;
}

const VarData& DictionaryIterator::Key() const
{
    return *iterator_->Key();
}

const VarData& DictionaryIterator::Value() const
{
    return *iterator_->Value();
}

} // namespace qv::value
