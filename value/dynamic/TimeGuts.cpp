// Storage of one absolute time. Times compare chronologically, read as a
// number of seconds since the time epoch, and as a logical by being a time
// at all (the earliest time stands for none).

#include "fen/AbsTime.h"
#include "value/dynamic/DynamicData.h"
#include "value/dynamic/RefCounted.h"

#include <cmath>

namespace qv::value::dynamic {
namespace {

class TimeGuts final : public RefCounted<ITimeGuts> {
public:
    explicit TimeGuts(const fen::AbsTime& time) : time_(time) {}

    bool ToBool() const override { return !time_.IsEarliest(); }
    double ToDouble() const override
    {
        return static_cast<double>(time_.seconds) + std::ldexp(static_cast<double>(time_.fraction), -64);
    }
    int Compare(const IGuts* other) const override
    {
        fen::AbsTime theirs{};
        static_cast<const ITimeGuts*>(other)->GetTime(&theirs);
        return time_ < theirs ? -1 : (time_ == theirs ? 0 : 1);
    }
    fen::AbsTime* GetTime(fen::AbsTime* out) const override
    {
        *out = time_;
        return out;
    }

private:
    fen::AbsTime time_;
};

} // namespace

ITimeGuts* NewVarDataSSTimeValue(const fen::AbsTime* time)
{
    return new TimeGuts(*time);
}

} // namespace qv::value::dynamic
