// Storage of flex data: one wrapped value, reached through the flex-data
// interface. It reads, and compares, as the value it wraps.

#include "value/VarData.h"
#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"

namespace qv::value::dynamic {
namespace {

class FlexDataGuts final : public RefCounted<IGuts>, public IFlexData {
public:
    explicit FlexDataGuts(const VarData& wrapped) : wrapped_(wrapped) {}

    std::uint32_t AddRef() override { return RefCounted::AddRef(); }
    std::uint32_t Release() override { return RefCounted::Release(); }
    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (iid == kIID_FlexData)
            return Offer(static_cast<IFlexData*>(this), out);
        return RefCounted::QueryInterface(iid, out);
    }
    bool ToBool() const override { return wrapped_.ToBool(); }
    double ToDouble() const override { return wrapped_.ToDouble(); }
    int Compare(const IGuts* other) const override
    {
        const auto* that = static_cast<const FlexDataGuts*>(static_cast<const RefCounted<IGuts>*>(other));
        return VarData::Compare(wrapped_, that->wrapped_);
    }
    void Unwrap(VarData* out, bool* success) const override
    {
        *out = wrapped_;
        *success = true;
    }

private:
    VarData wrapped_;
};

} // namespace

IGuts* NewVarDataFlexDataFromVarData(const VarData* value)
{
    return static_cast<RefCounted<IGuts>*>(new FlexDataGuts(*value));
}

} // namespace qv::value::dynamic
