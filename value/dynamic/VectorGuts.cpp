// Storage of a vector of values. Vectors compare element by element, then
// by length; they read as a number by their element count and as a logical
// by being non-empty.

#include "value/VarData.h"
#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"

#include <vector>

namespace qv::value::dynamic {
namespace {

class VectorGuts final : public RefCounted<IVectorGuts>, public IVectorElements {
public:
    VectorGuts() = default;
    explicit VectorGuts(const std::vector<VarData>& elements) : elements_(elements) {}

    std::uint32_t AddRef() override { return RefCounted::AddRef(); }
    std::uint32_t Release() override { return RefCounted::Release(); }
    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (iid == kIID_VectorElements)
            return Offer(static_cast<IVectorElements*>(this), out);
        return RefCounted::QueryInterface(iid, out);
    }
    bool ToBool() const override { return !elements_.empty(); }
    double ToDouble() const override { return static_cast<double>(elements_.size()); }
    int Compare(const IGuts* other) const override
    {
        const auto& those = static_cast<const VectorGuts*>(static_cast<const IVectorGuts*>(other))->elements_;
        const std::size_t common = std::min(elements_.size(), those.size());
        for (std::size_t i = 0; i < common; ++i)
            if (int c = VarData::Compare(elements_[i], those[i]); c != 0)
                return c;
        return elements_.size() < those.size() ? -1 : (elements_.size() > those.size() ? 1 : 0);
    }
    void SetElement(std::uint32_t index, VarData value) override
    {
        if (index >= elements_.size())
            elements_.resize(std::size_t{index} + 1);
        elements_[index] = std::move(value);
    }
    std::uint32_t Count() const override { return static_cast<std::uint32_t>(elements_.size()); }
    IVectorGuts* Copy() const override { return new VectorGuts(elements_); }
    void GetElement(VarData* out, std::uint32_t index) const override
    {
        *out = index < elements_.size() ? elements_[index] : VarData();
    }

private:
    std::vector<VarData> elements_;
};

} // namespace

IVectorGuts* NewVectorGuts()
{
    return new VectorGuts();
}

} // namespace qv::value::dynamic
