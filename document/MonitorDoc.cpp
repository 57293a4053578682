#include "document/MonitorDoc.h"

#include "client/OrvekClient.h"
#include "document/DropDecoding.h"
#include "document/OptionsFile.h"
#include "fen/OrvekURL.h"
#include "fen/osdep/Daemon.h"
#include "fen/osdep/TextConversion.h"
#include "network/session/OrvekSession.h"

#include <algorithm>

namespace qv::document {
namespace {

using fbfen::orvekclient::DataChangePacket;

/// Handles are issued for the whole process and survive new documents.
std::int32_t nextHandle = 1;

} // namespace

CMonitorDoc::CMonitorDoc(bool ensureServices)
{
    if (ensureServices)
        fen::osdep::EnsureRequiredDaemons();
    client = std::make_unique<fbfen::orvekclient::OrvekClient>(nullptr);
}

CMonitorDoc::~CMonitorDoc()
{
    client->UnsubscribeAll();
    client.reset();
}

void CMonitorDoc::AddView(DocumentView* view)
{
    views.push_back(view);
    PublishQueues();
}

void CMonitorDoc::RemoveView(DocumentView* view)
{
    std::erase(views, view);
    PublishQueues();
}

void CMonitorDoc::PublishQueues()
{
    auto queues = std::make_shared<QueueList>();
    for (DocumentView* view : views)
        if (DataView* dataView = view->AsDataView())
            queues->push_back(dataView->Changes());
    std::lock_guard guard(dataQueuesLock);
    dataQueues = std::move(queues);
}

DataView* CMonitorDoc::GetDataView() const
{
    for (DocumentView* view : views)
        if (DataView* dataView = view->AsDataView())
            return dataView;
    return nullptr;
}

bool CMonitorDoc::OnNewDocument()
{
    title = kUntitled;
    DataView* firstCleared = nullptr;
    for (DocumentView* view : views) {
        if (DataView* dataView = view->AsDataView()) {
            if (dataView->RemoveAll() && firstCleared == nullptr)
                firstCleared = dataView;
        } else if (BrowserView* browser = view->AsBrowserView()) {
            browser->RefreshTree();
        } else if (AlarmView* alarms = view->AsAlarmView()) {
            alarms->ForgetAll();
        }
    }
    modified = false;
    // Only the first new document of the process, the one start-up makes,
    // brings the last view back.
    if (firstCleared != nullptr)
        AutoLoad();
    return true;
}

void CMonitorDoc::LoadContents(DocumentContents& contents, const std::string& path)
{
    for (DocumentView* view : views) {
        if (DataView* dataView = view->AsDataView()) {
            if (contents.placement)
                dataView->ApplyPlacement(*contents.placement);
            dataView->RemoveAll();
            if (!contents.items.empty())
                dataView->FilterAndInsert(contents.items);
        } else if (BrowserView* browser = view->AsBrowserView()) {
            browser->RefreshTree();
        } else if (AlarmView* alarms = view->AsAlarmView()) {
            alarms->LoadItems(contents.items);
        }
    }
    if (title == kUntitled)
        title = DocumentTitle(path);
}

std::vector<std::string> CMonitorDoc::OpenDocument(const std::string& path)
{
    DocumentContents contents = LoadDocument(path); // throws before anything changes
    LoadContents(contents, path);
    title = DocumentTitle(path);
    modified = false;
    return std::move(contents.skipped);
}

void CMonitorDoc::SaveDocument(const std::string& path)
{
    DataView* dataView = GetDataView();
    const ItemBatch rows = dataView != nullptr ? dataView->RowsToSave() : ItemBatch{};
    const auto placement = dataView != nullptr ? dataView->Placement() : std::nullopt;
    document::SaveDocument(path, rows, placement);
    title = DocumentTitle(path);
    modified = false;
}

void CMonitorDoc::AutoSave()
{
    DataView* dataView = GetDataView();
    if (dataView == nullptr)
        return;
    const DisplayOptions options = dataView->Options();
    try {
        WriteOptionsFile(OptionsFilePath(), options);
    } catch (const std::exception&) {
        // Nothing to tell at exit; the next start uses the defaults.
    }
    if (!options.autoloadLastView)
        return;
    try {
        document::SaveDocument(AutoLoadFilePath(), dataView->RowsToSave(), dataView->Placement());
    } catch (const std::exception&) {
        // The previous auto-load file stays whole.
    }
}

void CMonitorDoc::AutoLoad()
{
    DataView* dataView = GetDataView();
    if (dataView == nullptr)
        return;
    try {
        dataView->SetOptions(ReadOptionsFile(OptionsFilePath()));
        if (!dataView->Options().autoloadLastView)
            return;
        const std::string path = AutoLoadFilePath();
        DocumentContents contents = LoadDocument(path);
        LoadContents(contents, path);
    } catch (const std::exception&) {
        // No configuration directory, or a missing or damaged auto-load
        // file: the list starts with what was loaded so far.
    }
}

std::int32_t CMonitorDoc::SubscribeItem(const fen::WString& url)
{
    if (!callbacksInstalled) {
        client->SetCallbackContext(this);
        client->SetDataCallback(DataChangeCallback);
        callbacksInstalled = true;
    }
    const fen::OrvekURL parsed(url); // a syntax error reaches the caller
    for (int tries = 0; tries < kLastHandle && IsHandleHeld(nextHandle); ++tries)
        nextHandle = nextHandle == kLastHandle ? 1 : nextHandle + 1;
    const std::int32_t handle = nextHandle;
    try {
        client->Subscribe(handle, parsed, 0, 0);
    } catch (const fen::exception::Exception&) {
        // The item is listed all the same and simply receives no data.
    }
    nextHandle = handle == kLastHandle ? 1 : handle + 1;
    return handle;
}

bool CMonitorDoc::IsHandleHeld(std::int32_t handle) const
{
    if (client->IsSubscribed(handle))
        return true;
    for (DocumentView* view : views)
        if (DataView* dataView = view->AsDataView(); dataView != nullptr && dataView->HoldsHandle(handle))
            return true;
    return false;
}

void CMonitorDoc::SetNextHandleForTesting(std::int32_t handle)
{
    nextHandle = handle;
}

void CMonitorDoc::UnsubscribeItem(std::int32_t handle)
{
    client->Unsubscribe(handle);
}

void CMonitorDoc::WriteItem(std::int32_t handle, const value::VarData& value)
{
    client->Write(handle, value);
}

void CMonitorDoc::DataChangeCallback(void* context, std::int32_t handle, std::uint32_t changeMask,
                                     const value::VarData* value, std::uint64_t quality, std::int32_t errorCode,
                                     fen::AbsTime timestamp)
{
    static_cast<CMonitorDoc*>(context)->DispatchDataChange(
        DataChangePacket{handle, changeMask, timestamp, quality, errorCode, *value});
}

void CMonitorDoc::DispatchDataChange(const DataChangePacket& packet)
{
    std::shared_ptr<const QueueList> queues;
    {
        std::lock_guard guard(dataQueuesLock);
        queues = dataQueues;
    }
    for (const auto& queue : *queues)
        queue->Deliver(packet);
}

void CMonitorDoc::Login(fen::WString user, fen::WString password, fen::WString domain)
{
    client->Login(std::move(user), std::move(password), std::move(domain));
    RefreshUserName();
}

std::string CMonitorDoc::GetUserName()
{
    if (callbacksInstalled)
        RefreshUserName();
    return userName;
}

void CMonitorDoc::RefreshUserName()
{
    network::session::IOrvekSession* session = client->GetSession();
    if (session == nullptr)
        return;
    network::session::IOrvekIdentity* identity = nullptr;
    if (session->GetIdentity(&identity) < 0 || identity == nullptr)
        return;
    char16_t* name = nullptr;
    const std::int32_t status = identity->GetUserName(&name);
    identity->Release();
    if (status < 0 || name == nullptr)
        return;
    const fen::String narrow = fen::osdep::ToAnsi(fen::WString(name));
    network::session::OrvekFreeString(name);
    userName.assign(narrow.View());
}

void CMonitorDoc::UpdateAllViews(DocumentView* sender, const UpdateHint& hint)
{
    for (DocumentView* view : views)
        view->OnUpdate(sender, hint);
}

void CMonitorDoc::OnDropItems(std::string_view block)
{
    ItemBatch batch = DecodeDropBlock(block);
    if (batch.empty())
        return;
    for (DocumentView* view : views)
        if (DataView* dataView = view->AsDataView()) {
            dataView->FilterAndInsert(batch);
            break;
        }
    for (DocumentView* view : views)
        if (AlarmView* alarms = view->AsAlarmView()) {
            alarms->AddItems(batch);
            break;
        }
}

} // namespace qv::document
