#include "network/session/OrvekSession.h"
#include "network/session/SessionCredentials.h"

#include "fen/osdep/OrvekPort.h"
#include "network/protocol/TextCoding.h"
#include "value/dynamic/RefCounted.h"

#include <mosquitto.h>

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <new>
#include <string>

namespace qv::network::session {
namespace {

using value::dynamic::RefCounted;

/// How long Login waits for the data server's answer.
constexpr auto kLoginTimeout = std::chrono::seconds(3);

/// Answered only by the sessions of this library, so that the real-time
/// library can read their login: {2D9F0B7E-61C4-4F3A-8B0D-5E9A7C31D8A4}.
constexpr Guid kIID_SessionObject{0x2D9F0B7E, 0x61C4, 0x4F3A, {0x8B, 0x0D, 0x5E, 0x9A, 0x7C, 0x31, 0xD8, 0xA4}};

std::mutex g_libraryMutex;
int g_libraryStarts = 0;

std::string Utf8(const char16_t* text)
{
    return text == nullptr ? std::string() : protocol::Utf8FromUtf16(std::u16string_view(text));
}

/// Connects to this machine's data server with `credentials` and reports
/// how it answered.
std::int32_t CheckLogin(const SessionCredentials& credentials)
{
    std::uint16_t port = 0;
    try {
        port = fen::osdep::GetOrvekDataPort();
    } catch (...) {
        return kStatusNoDataServer;
    }

    OrvekLibraryStart();
    struct Answer {
        std::atomic<int> code{-1};
    } answer;
    mosquitto* handle = mosquitto_new(nullptr, true, &answer);
    if (handle == nullptr) {
        OrvekLibraryStop();
        return kStatusOutOfMemory;
    }
    mosquitto_int_option(handle, MOSQ_OPT_PROTOCOL_VERSION, MQTT_PROTOCOL_V311);
    ApplyCredentials(handle, credentials);
    mosquitto_connect_callback_set(handle, [](mosquitto*, void* context, int code) {
        static_cast<Answer*>(context)->code = code;
    });

    std::int32_t status = kStatusNoDataServer;
    if (mosquitto_connect(handle, "127.0.0.1", port, 10) == MOSQ_ERR_SUCCESS) {
        const auto deadline = std::chrono::steady_clock::now() + kLoginTimeout;
        while (answer.code < 0 && std::chrono::steady_clock::now() < deadline) {
            if (mosquitto_loop(handle, 50, 1) != MOSQ_ERR_SUCCESS && answer.code < 0)
                break;
        }
        // 4: bad user name or password; 5: not authorised.
        if (answer.code == 0)
            status = kStatusOk;
        else if (answer.code == 4 || answer.code == 5)
            status = kStatusAccessDenied;
        mosquitto_disconnect(handle);
    }
    mosquitto_destroy(handle);
    OrvekLibraryStop();
    return status;
}

class Identity final : public RefCounted<IOrvekIdentity> {
public:
    explicit Identity(std::u16string user) : user_(std::move(user)) {}

    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (out == nullptr)
            return kStatusNullPointer;
        if (iid == kIID_IUnknown)
            return Offer(out);
        *out = nullptr;
        return value::dynamic::kNoInterface;
    }
    std::int32_t Reserved3() override { return kStatusNotImplemented; }
    std::int32_t Reserved4() override { return kStatusNotImplemented; }
    std::int32_t Reserved5() override { return kStatusNotImplemented; }

    std::int32_t GetUserName(char16_t** name) override
    {
        if (name == nullptr)
            return kStatusNullPointer;
        *name = static_cast<char16_t*>(std::malloc((user_.size() + 1) * sizeof(char16_t)));
        if (*name == nullptr)
            return kStatusOutOfMemory;
        std::memcpy(*name, user_.c_str(), (user_.size() + 1) * sizeof(char16_t));
        return kStatusOk;
    }

private:
    std::int32_t Offer(void** out)
    {
        AddRef();
        *out = static_cast<IOrvekIdentity*>(this);
        return kStatusOk;
    }

    std::u16string user_;
};

class Session final : public RefCounted<IOrvekSession> {
public:
    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (out == nullptr)
            return kStatusNullPointer;
        if (iid == kIID_IUnknown || iid == kIID_IOrvekSession || iid == kIID_SessionObject) {
            AddRef();
            *out = static_cast<IOrvekSession*>(this);
            return kStatusOk;
        }
        *out = nullptr;
        return value::dynamic::kNoInterface;
    }

    std::int32_t Login(const char16_t* user, const char16_t* password, const void*) override
    {
        try {
            SessionCredentials candidate{Utf8(user), Utf8(password)};
            {
                std::lock_guard lock(mutex_);
                if (closed_)
                    return kStatusClosed;
            }
            const std::int32_t status = CheckLogin(candidate);
            if (status < 0)
                return status;
            std::lock_guard lock(mutex_);
            if (closed_)
                return kStatusClosed;
            credentials_ = std::move(candidate);
            userName_ = user == nullptr ? std::u16string() : std::u16string(user);
            return kStatusOk;
        } catch (const std::bad_alloc&) {
            return kStatusOutOfMemory;
        }
    }

    std::int32_t IsLoggedIn() override
    {
        std::lock_guard lock(mutex_);
        return credentials_.user.empty() ? 1 : kStatusOk;
    }

    std::int32_t ResetLogin() override
    {
        std::lock_guard lock(mutex_);
        credentials_ = {};
        userName_.clear();
        return kStatusOk;
    }

    std::int32_t Close() override
    {
        std::lock_guard lock(mutex_);
        credentials_ = {};
        userName_.clear();
        closed_ = true;
        return kStatusOk;
    }

    std::int32_t GetIdentity(IOrvekIdentity** identity) override
    {
        if (identity == nullptr)
            return kStatusNullPointer;
        *identity = nullptr;
        std::lock_guard lock(mutex_);
        *identity = new (std::nothrow) Identity(userName_);
        return *identity == nullptr ? kStatusOutOfMemory : kStatusOk;
    }

    SessionCredentials Credentials()
    {
        std::lock_guard lock(mutex_);
        return credentials_;
    }

private:
    std::mutex mutex_;
    SessionCredentials credentials_;
    std::u16string userName_;
    bool closed_ = false;
};

} // namespace

bool NewOrvekSession(IOrvekSession** session)
{
    if (session == nullptr)
        return false;
    *session = new (std::nothrow) Session();
    return *session != nullptr;
}

void OrvekFreeString(char16_t* text)
{
    std::free(text);
}

void OrvekLibraryStart()
{
    std::lock_guard lock(g_libraryMutex);
    if (g_libraryStarts++ == 0)
        mosquitto_lib_init();
}

void OrvekLibraryStop()
{
    std::lock_guard lock(g_libraryMutex);
    if (g_libraryStarts > 0 && --g_libraryStarts == 0)
        mosquitto_lib_cleanup();
}

SessionCredentials GetSessionCredentials(IOrvekSession* session)
{
    void* found = nullptr;
    if (session == nullptr || session->QueryInterface(kIID_SessionObject, &found) != kStatusOk || found == nullptr)
        return {};
    auto* ours = static_cast<Session*>(static_cast<IOrvekSession*>(found));
    SessionCredentials credentials = ours->Credentials();
    ours->Release();
    return credentials;
}

void ApplyCredentials(mosquitto* handle, const SessionCredentials& credentials)
{
    if (credentials.user.empty())
        mosquitto_username_pw_set(handle, nullptr, nullptr);
    else
        mosquitto_username_pw_set(handle, credentials.user.c_str(), credentials.password.c_str());
}

} // namespace qv::network::session
