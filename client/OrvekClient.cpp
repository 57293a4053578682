#include "client/OrvekClient.h"

#include "client/OCException.h"
#include "client/Receiver.h"
#include "client/SubscriptionURL.h"
#include "network/realtime/OrvekRealTime.h"
#include "network/session/OrvekSession.h"

#include <mutex>

namespace qv::fbfen::orvekclient {

namespace realtime = network::realtime;
namespace session_lib = network::session;

OrvekClient::OrvekClient(session_lib::IOrvekSession* givenSession)
    : receiver(new Receiver), session(givenSession)
{
    session_lib::OrvekLibraryStart();
    if (session == nullptr && session_lib::NewOrvekSession(&session)) {
        session->ResetLogin();
        ownsSession = true;
    }
    if (!realtime::NewOrvekRealTime(session, receiver, &realTime))
        realTime = nullptr;
}

OrvekClient::~OrvekClient()
{
    receiver->ReleaseAll();
    if (ownsSession) {
        session->Close();
        session->Release();
    }
    receiver->Release();
    if (realTime != nullptr)
        realTime->Release();
    session_lib::OrvekLibraryStop();
}

std::int32_t OrvekClient::Login(fen::WString user, fen::WString password, fen::WString /*domain*/)
{
    if (session == nullptr)
        return kStatusUnspecifiedFailure;
    const std::int32_t status = session->Login(user.c_str(), password.c_str(), nullptr);
    if (status < 0)
        session->ResetLogin();
    return status;
}

void OrvekClient::SetCallbackContext(void* context)
{
    receiver->SetCallbackContext(context);
}

void OrvekClient::SetDataCallback(DataCallback callback)
{
    receiver->SetDataCallback(callback);
}

void OrvekClient::Subscribe(std::int32_t handle, const fen::OrvekURL& url, std::uint32_t optionA,
                            std::uint32_t optionB)
{
    std::lock_guard guard(lock);
    if (receiver->HasSubscription(handle))
        throw OCException(kStatusInvalidArgument);

    realtime::SubscribeOptions options;
    if (optionA != 0) {
        options.mask |= 0x10;
        options.flags |= 0x0040;
        options.optionA = optionA;
    }
    if (optionB != 0) {
        options.mask |= 0x20;
        options.flags |= 0x0040;
        options.optionB = optionB;
    }

    const fen::WString text = SubscriptionText(url);
    if (realTime == nullptr)
        throw OCException(kStatusUnspecifiedFailure);
    realtime::ISubscription* subscription = nullptr;
    const std::int32_t status = realTime->Subscribe(text.c_str(), handle, &options, &subscription);
    if (status < 0 || subscription == nullptr)
        throw OCException(status < 0 ? status : kStatusUnspecifiedFailure);
    // Only this lock's holder adds entries, and the handle was free above.
    if (!receiver->AddSubscription(subscription, handle))
        subscription->Release();
}

void OrvekClient::Write(std::int32_t handle, const value::VarData& value)
{
    if (realtime::ISubscription* subscription = receiver->AcquireSubscription(handle)) {
        subscription->Write(value);
        subscription->Release();
    }
}

void OrvekClient::Unsubscribe(std::int32_t handle)
{
    receiver->RemoveSubscription(handle);
}

bool OrvekClient::IsSubscribed(std::int32_t handle) const
{
    return receiver->HasSubscription(handle);
}

void OrvekClient::UnsubscribeAll()
{
    receiver->ReleaseAll();
}

} // namespace qv::fbfen::orvekclient
