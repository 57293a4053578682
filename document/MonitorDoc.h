#pragma once
/// \file
/// The one document of the monitor: it owns the connection to the network,
/// issues subscription handles, hands every data change to the data views'
/// queues, and reads and writes document files through its views. The item
/// list itself belongs to the data view.
///
/// Threads: everything runs on the user-interface thread except the data
/// callback, which runs on library threads and only appends to the data
/// views' change queues. It reads them from a snapshot that holds a share
/// of each queue, so views may come and go while changes arrive; the
/// snapshot's lock is held only to copy it, and no other lock is taken
/// under it.

#include "client/DataChangePacket.h"
#include "document/DocumentViews.h"
#include "fen/Noncopyable.h"
#include "fen/String.h"

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace qv::fbfen::orvekclient {
class OrvekClient;
}

namespace qv::document {

class CMonitorDoc : private fen::Noncopyable {
public:
    /// The title of a document that was never saved or read.
    static constexpr char kUntitled[] = "Untitled";
    /// Subscription handles run from 1 to this, then start again at 1.
    static constexpr std::int32_t kLastHandle = 100000;

    /// With `ensureServices`, first starts each of this machine's required
    /// services that is not running (a failure throws: the monitor cannot
    /// work without them); then connects with a session of its own.
    explicit CMonitorDoc(bool ensureServices = true);
    /// Ends every subscription, then closes the connection.
    ~CMonitorDoc();

    /// Views in creation order: browser, data view, alarm view. Not owned;
    /// a view removes itself before it goes.
    void AddView(DocumentView* view);
    void RemoveView(DocumentView* view);
    const std::vector<DocumentView*>& Views() const noexcept { return views; }
    /// The first data view, or null.
    DataView* GetDataView() const;

    /// Empties the views for a new document; the first time in the process
    /// (start-up) the last view is loaded again when that option is on.
    bool OnNewDocument();

    /// Reads the document file `path` into the views. A file that cannot
    /// be read or is damaged throws and changes nothing. Returns one
    /// message per item left out for its invalid URL.
    std::vector<std::string> OpenDocument(const std::string& path);
    /// Writes the data view's rows and the window placement to `path`,
    /// atomically; throws on failure and the old file stays whole.
    void SaveDocument(const std::string& path);

    /// Writes the options file, and the auto-load file while that option is
    /// on; failures are ignored so that the exit goes on.
    void AutoSave();
    /// Reads the options file into the data view, and the auto-load file
    /// when the option is on; failures keep what was loaded so far.
    void AutoLoad();

    /// Subscribes `url` and returns its handle. A URL the grammar rejects
    /// throws SyntaxError and issues no handle; a subscription the client
    /// refuses still uses up its handle, whose item then receives nothing.
    /// After the wrap, handles that a subscription or a row still holds are
    /// passed over, so that two items never share one.
    std::int32_t SubscribeItem(const fen::WString& url);
    /// Ends the subscription of `handle`.
    void UnsubscribeItem(std::int32_t handle);
    /// Sends `value` to the variable of `handle`.
    void WriteItem(std::int32_t handle, const value::VarData& value);

    /// Logs the session in and reads back the user's name.
    void Login(fen::WString user, fen::WString password, fen::WString domain);
    /// The logged-in user's name, "(nobody)" before any login; read anew
    /// from the session once an item has been subscribed.
    std::string GetUserName();

    /// Tells every view, in creation order, about added or removed items.
    void UpdateAllViews(DocumentView* sender, const UpdateHint& hint);
    /// Adds items dropped on the list: the data view filters and inserts
    /// them, then the alarm view follows what is left. A malformed block
    /// adds nothing.
    void OnDropItems(std::string_view block);

    void SetModifiedFlag(bool modified) noexcept { this->modified = modified; }
    bool IsModified() const noexcept { return modified; }
    const std::string& GetTitle() const noexcept { return title; }
    void SetTitle(std::string newTitle) { title = std::move(newTitle); }

    fbfen::orvekclient::OrvekClient* GetClient() const noexcept { return client.get(); }

    /// Makes `handle` the next one issued, so that a test can reach the wrap.
    static void SetNextHandleForTesting(std::int32_t handle);

    /// Appends a copy of `packet` to every data view's queue.
    void DispatchDataChange(const fbfen::orvekclient::DataChangePacket& packet);

private:
    void PublishQueues();
    bool IsHandleHeld(std::int32_t handle) const;
    static void DataChangeCallback(void* context, std::int32_t handle, std::uint32_t changeMask,
                                   const value::VarData* value, std::uint64_t quality, std::int32_t errorCode,
                                   fen::AbsTime timestamp);
    void RefreshUserName();
    void LoadContents(DocumentContents& contents, const std::string& path);

    std::unique_ptr<fbfen::orvekclient::OrvekClient> client;
    bool callbacksInstalled = false;
    std::string userName = "(nobody)";
    std::vector<DocumentView*> views;
    /// The data views' queues, as the data callback reads them.
    using QueueList = std::vector<fbfen::orvekclient::ChangeQueuePtr>;
    std::shared_ptr<const QueueList> dataQueues = std::make_shared<const QueueList>();
    mutable std::mutex dataQueuesLock;
    bool modified = false;
    std::string title = kUntitled;
};

} // namespace qv::document
