#include "common/SyncWorker.h"

#include <malloc.h>

#include <cerrno>
#include <mutex>

#include "common/SyncLog.h"
#include "common/SyncResult.h"
#include "platform/database.h"

using sync_result::kFailed;
using sync_result::kOk;

// Travels from the requester to the worker thread and back. Main thread, but for `result`, which the worker thread writes before
// it posts the response.
struct SyncWorker::SyncRequest {
    SyncWorker* worker;  // NULL once the worker is gone
    SyncDirector* director;
    IResultListener* listener;
    int result;
    int accountId;
};

namespace {

// Between the thread that posts a source and the one that it runs on. The main loop has a lock of its own there, which the thread
// sanitizer cannot see.
std::mutex gHandOver;

// Sources own a reference to their request.
template <class Request>
gpointer toSource(std::shared_ptr<Request> request) {
    const std::lock_guard lock(gHandOver);
    return new std::shared_ptr<Request>(std::move(request));
}

template <class Request>
std::shared_ptr<Request> fromSource(gpointer data) {
    const std::lock_guard lock(gHandOver);
    return *static_cast<std::shared_ptr<Request>*>(data);
}

template <class Request>
void freeFromSource(gpointer data) {
    const std::lock_guard lock(gHandOver);
    delete static_cast<std::shared_ptr<Request>*>(data);
}

}  // namespace

SyncWorker::SyncWorker(int accountId) : mAccountId(accountId) {
    initialize();
}

void SyncWorker::initialize() {
    (void)g_main_context_default();  // answers come on it, and it is made by the thread that runs it
    mpContext = g_main_context_new();
    SYNC_ASSERT_TEXT(mpContext != nullptr, "mpContext");
    mpLoop = g_main_loop_new(mpContext, FALSE);
    SYNC_ASSERT_TEXT(mpLoop != nullptr, "mpLoop");
    g_main_context_unref(mpContext);
    mpThread = g_thread_new("sync-worker", threadBody, mpLoop);
    SYNC_ASSERT_TEXT(mpThread != nullptr, "mpThread");
}

SyncWorker::~SyncWorker() {
    mIsInProgress = false;
    // The loop may not have begun to run yet, and a quit before that would be lost.
    GSource* quit = g_idle_source_new();
    g_source_set_callback(
        quit,
        [](gpointer loop) -> gboolean {
            g_main_loop_quit(static_cast<GMainLoop*>(loop));
            return G_SOURCE_REMOVE;
        },
        mpLoop, nullptr);
    g_source_attach(quit, g_main_loop_get_context(mpLoop));
    g_source_unref(quit);
    g_thread_join(mpThread);
    g_main_loop_unref(mpLoop);
    if (mpRequest) mpRequest->worker = nullptr;
}

gpointer SyncWorker::threadBody(gpointer loop) {
    // What a director attaches to the thread's default context runs here, not on the main loop.
    GMainContext* context = g_main_loop_get_context(static_cast<GMainLoop*>(loop));
    g_main_context_push_thread_default(context);
    g_main_loop_run(static_cast<GMainLoop*>(loop));
    g_main_context_pop_thread_default(context);
    return nullptr;
}

int SyncWorker::start(SyncDirector* director, IResultListener* listener) {
    if (mIsInProgress) {
        SYNC_ERR("It's in progress");
        return kFailed;
    }
    mpSyncDirector = director;
    mpResultListener = listener;
    mIsInProgress = true;
    return addRequest();
}

int SyncWorker::addRequest() {
    GSource* source = g_idle_source_new();
    if (source == nullptr) {
        SYNC_ERR("g_idle_source_new failed : %s", g_strerror(errno));
        return kFailed;
    }
    mpRequest = std::make_shared<SyncRequest>(
        SyncRequest{this, mpSyncDirector, mpResultListener, kFailed, mAccountId});
    g_source_set_callback(source, runRequest, toSource(mpRequest), freeFromSource<SyncRequest>);
    const guint srcId = g_source_attach(source, g_main_loop_get_context(mpLoop));
    SYNC_ASSERT(srcId != 0);
    g_source_unref(source);
    return kOk;
}

gboolean SyncWorker::runRequest(gpointer data) {
    const std::shared_ptr<SyncRequest> request = fromSource<SyncRequest>(data);
    dlog_set_account(request->accountId);
    request->result = request->director->run();
    // What the run needed goes back: the next one may be hours away.
    db_util_release_memory();
    malloc_trim(0);
    addResponse(request);
    return G_SOURCE_REMOVE;
}

void SyncWorker::addResponse(std::shared_ptr<SyncRequest> request) {
    const guint srcId = g_idle_add_full(G_PRIORITY_DEFAULT_IDLE, onResponse, toSource(std::move(request)),
                                        freeFromSource<SyncRequest>);
    SYNC_ASSERT(srcId != 0);
}

gboolean SyncWorker::onResponse(gpointer data) {
    const std::shared_ptr<SyncRequest> request = fromSource<SyncRequest>(data);
    SyncWorker* worker = request->worker;
    if (worker == nullptr) return G_SOURCE_REMOVE;
    if (worker->isStopped()) {
        request->listener->onSyncStopped(request->director, request->result);
    } else {
        request->listener->onSyncCompleted(request->director, request->result);
    }
    if (request->worker == nullptr) return G_SOURCE_REMOVE;  // the listener has destroyed it
    worker->mIsInProgress = false;
    worker->mpSyncDirector = nullptr;
    worker->mpResultListener = nullptr;
    return G_SOURCE_REMOVE;
}

int SyncWorker::stop(IResultListener* listener) {
    if (!mIsInProgress) {
        SYNC_ERR("It's not in progress");
        return kFailed;
    }
    SYNC_ASSERT_TEXT(mpSyncDirector != nullptr, "mpSyncDirector");
    mpResultListener = listener;
    mIsInProgress = false;
    return kOk;
}
