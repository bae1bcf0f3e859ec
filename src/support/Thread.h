// A POSIX thread that runs either a start function with its argument or a subclass's Run body.
// Thread safety: none of its own; Start, Join and IsJoinable are called by the thread that owns
// the object.
#pragma once

#include <pthread.h>

#include <cstddef>
#include <string>

namespace vq {
namespace dsc {
namespace osdep {

class Thread {
  public:
    using StartFunction = void (*)(void* argument);
    // Stack size used when a start does not ask for one.
    static constexpr size_t kDefaultStackSize = 0x40000;

    Thread() = default;
    // Waits for a thread that is still running (unless it is the calling thread itself).
    virtual ~Thread();
    Thread(const Thread&) = delete;
    Thread& operator=(const Thread&) = delete;

    // Starts a thread running `function(argument)`. A non-zero `stackSize` gets the platform's
    // guard size added; 0 gives kDefaultStackSize. A second start raises InvalidOperation; a
    // refused thread raises PosixError.
    void Start(StartFunction function, void* argument, size_t stackSize = 0);
    // Starts a thread running Run, named `name` (cut to the platform's 15 characters).
    void Start(const std::string& name, size_t stackSize = 0);

    // Waits until the thread has ended; does nothing when no thread runs or it was joined.
    void Join();
    // True between a successful start and Join.
    bool IsJoinable() const { return joinable_; }

  protected:
    // The thread body; the base runs the start function given to Start. A subclass that
    // overrides it must Join in its own destructor, before its members are destroyed.
    virtual void Run();

  private:
    static void* Trampoline(void* self);
    void Launch(size_t stackSize);

    StartFunction function_ = nullptr;
    void* argument_ = nullptr;
    std::string name_;
    pthread_t id_{};
    bool joinable_ = false;
};

}  // namespace osdep
}  // namespace dsc
}  // namespace vq
