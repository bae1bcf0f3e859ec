#include "support/Thread.h"

#include "support/Exceptions.h"
#include "support/TraceGate.h"

namespace vq {
namespace dsc {
namespace osdep {
namespace {

constexpr size_t kThreadNameLimit = 15;

// Owns a thread attribute object while a thread is created.
class ThreadAttributes {
  public:
    ThreadAttributes() {
        const int result = pthread_attr_init(&attributes_);
        if (result != 0) {
            throw PosixError(result);
        }
    }
    ~ThreadAttributes() { pthread_attr_destroy(&attributes_); }
    ThreadAttributes(const ThreadAttributes&) = delete;
    ThreadAttributes& operator=(const ThreadAttributes&) = delete;

    pthread_attr_t* Get() { return &attributes_; }

  private:
    pthread_attr_t attributes_;
};

}  // namespace

Thread::~Thread() {
    if (joinable_) {
        if (pthread_equal(id_, pthread_self()) != 0) {
            pthread_detach(id_);
        } else {
            pthread_join(id_, nullptr);
        }
    }
}

void Thread::Start(StartFunction function, void* argument, size_t stackSize) {
    if (joinable_) {
        throw exception::InvalidOperation();
    }
    function_ = function;
    argument_ = argument;
    Launch(stackSize);
}

void Thread::Start(const std::string& name, size_t stackSize) {
    if (joinable_) {
        throw exception::InvalidOperation();
    }
    name_ = name.substr(0, kThreadNameLimit);
    Launch(stackSize);
}

void Thread::Join() {
    if (!joinable_) {
        return;
    }
    const int result = pthread_join(id_, nullptr);
    if (result != 0) {
        throw PosixError(result);
    }
    joinable_ = false;
}

void Thread::Run() {
    if (function_ != nullptr) {
        function_(argument_);
    }
}

void Thread::Launch(size_t stackSize) {
    ThreadAttributes attributes;
    size_t effectiveStackSize = kDefaultStackSize;
    if (stackSize != 0) {
        size_t guardSize = 0;
        pthread_attr_getguardsize(attributes.Get(), &guardSize);
        effectiveStackSize = stackSize + guardSize;
    }
    int result = pthread_attr_setstacksize(attributes.Get(), effectiveStackSize);
    if (result != 0) {
        throw PosixError(result);
    }
    result = pthread_create(&id_, attributes.Get(), &Thread::Trampoline, this);
    if (result != 0) {
        throw PosixError(result);
    }
    joinable_ = true;
}

void* Thread::Trampoline(void* self) {
    auto* thread = static_cast<Thread*>(self);
    if (!thread->name_.empty()) {
        pthread_setname_np(pthread_self(), thread->name_.c_str());
    }
    // An exception must not end the whole process from a worker thread.
    try {
        thread->Run();
    } catch (...) {
        TraceIfEnabled("Uncaught exception on a worker thread", kTraceErrors);
    }
    return nullptr;
}

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
