#include <korvane/foundation/KVThread.h>

#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVInfo.h>

#include <pthread.h>

#include <memory>
#include <string>
#include <vector>

namespace {

/// What a new thread needs to know; it frees the record itself, also when it is cancelled.
struct StartRecord {
    void (*function)(void*);
    void* argument;
    std::string name;
};

void* startThread(void* argument)
{
    std::unique_ptr<StartRecord> const record(static_cast<StartRecord*>(argument));
    if (!record->name.empty())
        ::pthread_setname_np(::pthread_self(), record->name.c_str());
    record->function(record->argument);
    return nullptr;
}

/// The most that the kernel keeps of a thread's name, cut between two characters of UTF-8.
std::string threadName(char const* name)
{
    std::string text = name ? name : "";
    std::size_t length = 15;
    if (text.size() <= length)
        return text;
    while (length > 0 && (static_cast<unsigned char>(text[length]) & 0xC0) == 0x80)
        --length;
    return text.substr(0, length);
}

struct ForkRecord {
    void (*function)(void*, int, int);
    void* argument;
    int index;
    int count;
    pthread_t thread;
    bool started;

    void run() const { function(argument, index, count); }
};

void* startWorker(void* record)
{
    static_cast<ForkRecord const*>(record)->run();
    return nullptr;
}

} // namespace

KVThread::KVThread(void (*function)(void*), void* argument, char const* name)
{
    auto record = std::make_unique<StartRecord>(StartRecord{function, argument, threadName(name)});
    int const result = ::pthread_create(&thread_, nullptr, &startThread, record.get());
    if (result != 0)
        throw KVSystemException(KVString::ssprintf("pthread_create returned %d", result), __FILE__,
                                __LINE__);
    // The thread owns it now.
    static_cast<void>(record.release());
    attached_ = true;
}

KVThread::~KVThread()
{
    detach();
}

KVThread::Native KVThread::self() noexcept
{
    return ::pthread_self();
}

void KVThread::cancel() noexcept
{
    if (attached_)
        ::pthread_cancel(thread_);
}

void KVThread::wait() noexcept
{
    if (attached_)
        ::pthread_join(thread_, nullptr);
    attached_ = false;
}

void KVThread::detach() noexcept
{
    if (attached_)
        ::pthread_detach(thread_);
    attached_ = false;
}

void KVThread::KVFork(void (*function)(void*, int, int), void* argument)
{
    int const count = KVInfo_ProcessorCount();
    std::vector<ForkRecord> workers;
    workers.reserve(static_cast<std::size_t>(count));
    for (int index = 0; index < count; ++index) {
        ForkRecord& worker =
            workers.emplace_back(ForkRecord{function, argument, index, count, {}, false});
        worker.started = ::pthread_create(&worker.thread, nullptr, &startWorker, &worker) == 0;
        // Every index runs once, with or without a thread of its own.
        if (!worker.started)
            worker.run();
    }
    for (ForkRecord const& worker : workers)
        if (worker.started)
            ::pthread_join(worker.thread, nullptr);
}
