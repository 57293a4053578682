#include "client/SubscriptionURL.h"

#include "client/OCException.h"
#include "fen/OrvekURL.h"
#include "fen/osdep/MachineIdentity.h"

namespace qv::fbfen::orvekclient {

using fen::OrvekURL;

fen::WString SubscriptionText(const OrvekURL& url)
{
    OrvekURL copy(url);
    switch (copy.GetKind()) {
    case OrvekURL::HostForm:
        if (copy.GetSegmentCount() > 0) {
            OrvekURL::Segment& host = copy.GetSegment(0);
            // WString compares ignoring case in the user's locale.
            if (!host.IsParent() && host.GetName() == fen::WString(u"localhost"))
                host.SetName(fen::osdep::GetCachedLocalHostName());
        }
        break;
    case OrvekURL::LocalForm: {
        // The local form has no host segment and its first segment (the
        // process) has no separator; as a host form it follows the host
        // after a backslash.
        fen::Vector<OrvekURL::Segment> segments;
        segments.push_back(OrvekURL::Segment(0, fen::osdep::GetCachedLocalHostName()));
        for (const OrvekURL::Segment& segment : copy.GetSegments()) {
            if (!segment.HasNoSeparator())
                segments.push_back(segment);
            else if (segment.IsParent())
                segments.push_back(OrvekURL::Segment(u'\\'));
            else
                segments.push_back(OrvekURL::Segment(u'\\', segment.GetName()));
        }
        copy.SetSegments(segments);
        copy.SetKind(OrvekURL::HostForm);
        break;
    }
    default:
        throw OCException(kStatusInvalidArgument);
    }
    return copy.ToString();
}

} // namespace qv::fbfen::orvekclient
