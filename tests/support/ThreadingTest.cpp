#include <pthread.h>
#include <signal.h>

#include <atomic>
#include <chrono>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include "support/Exceptions.h"
#include "support/Mutex.h"
#include "support/Sleep.h"
#include "support/Thread.h"

namespace kest::test::support {

namespace {

using vq::dsc::Mutex;
using vq::dsc::ScopedLock;
using vq::dsc::exception::InvalidOperation;
using vq::dsc::osdep::SleepMs;
using vq::dsc::osdep::Thread;

// Starts `body()` on `thread` through the function-and-argument form.
template <class Body>
void StartOn(Thread& thread, Body& body) {
    thread.Start([](void* argument) { (*static_cast<Body*>(argument))(); }, &body);
}

template <class Body>
void RunOnThread(Body& body) {
    Thread thread;
    StartOn(thread, body);
    thread.Join();
}

TEST(MutexTest, RecursionIsCountedExcludesOtherThreadsAndBlocksThemUntilTheFullRelease) {
    Mutex mutex;
    EXPECT_THROW(mutex.Unlock(), InvalidOperation);
    mutex.Lock();
    mutex.Lock();
    EXPECT_EQ(mutex.RecursionCount(), 2u);
    EXPECT_TRUE(mutex.IsOwnedByCurrentThread());

    bool otherGotIt = true;
    bool otherOwns = true;
    auto fromOtherThread = [&] {
        otherOwns = mutex.IsOwnedByCurrentThread();
        EXPECT_THROW(mutex.Unlock(), InvalidOperation);
        otherGotIt = mutex.TryLock();
        if (otherGotIt) {
            mutex.Unlock();
        }
    };
    RunOnThread(fromOtherThread);
    EXPECT_FALSE(otherOwns);
    EXPECT_FALSE(otherGotIt);

    mutex.Unlock();
    EXPECT_EQ(mutex.RecursionCount(), 1u);
    RunOnThread(fromOtherThread);
    EXPECT_FALSE(otherGotIt) << "one level of recursion is still held";

    mutex.Lock();
    std::atomic<bool> released{false};
    bool sawReleased = false;
    uint32_t countInside = 0;
    auto waiter = [&] {
        ScopedLock lock(mutex);
        sawReleased = released.load();
        countInside = mutex.RecursionCount();
    };
    Thread thread;
    StartOn(thread, waiter);
    SleepMs(20);
    mutex.Unlock();
    SleepMs(20);
    released = true;
    mutex.Unlock();
    thread.Join();
    EXPECT_TRUE(sawReleased);
    EXPECT_EQ(countInside, 1u);
    EXPECT_EQ(mutex.RecursionCount(), 0u);
}

// A thread whose body records its own name and stack size.
class ProbeThread : public Thread {
  public:
    ~ProbeThread() override { Join(); }
    std::string name;
    size_t stackSize = 0;

  protected:
    void Run() override {
        char buffer[16] = {};
        pthread_getname_np(pthread_self(), buffer, sizeof(buffer));
        name = buffer;
        pthread_attr_t attributes;
        pthread_getattr_np(pthread_self(), &attributes);
        pthread_attr_getstacksize(&attributes, &stackSize);
        pthread_attr_destroy(&attributes);
    }
};

TEST(ThreadTest, RunBodyGetsNameAndStackSizeAndMayThrow) {
    ProbeThread named;
    named.Start("ToggleNIC");
    EXPECT_THROW(named.Start("again"), InvalidOperation);
    named.Join();
    EXPECT_FALSE(named.IsJoinable());
    EXPECT_EQ(named.name, "ToggleNIC");
    EXPECT_GE(named.stackSize, Thread::kDefaultStackSize);

    ProbeThread large;
    large.Start("a-very-long-thread-name", 0x100000);
    large.Join();
    EXPECT_EQ(large.name, "a-very-long-thr");
    EXPECT_GE(large.stackSize, 0x100000u);

    // An exception in a body does not end the process.
    std::atomic<bool> ran{false};
    {
        Thread thread;
        thread.Start(
            [](void* argument) {
                static_cast<std::atomic<bool>*>(argument)->store(true);
                throw std::runtime_error("body failed");
            },
            &ran);
    }
    EXPECT_TRUE(ran.load());
}

void IgnoreSignal(int) {}

TEST(SleepTest, SignalDoesNotCutTheSleepShort) {
    struct sigaction action {};
    struct sigaction previous {};
    action.sa_handler = IgnoreSignal;
    sigaction(SIGUSR1, &action, &previous);  // no SA_RESTART: the sleep sees EINTR

    pthread_t sleeper = pthread_self();
    auto interrupt = [&sleeper] {
        for (int i = 0; i < 5; ++i) {
            SleepMs(20);
            pthread_kill(sleeper, SIGUSR1);
        }
    };
    Thread interrupter;
    const auto start = std::chrono::steady_clock::now();
    StartOn(interrupter, interrupt);
    SleepMs(200);
    const auto elapsed = std::chrono::steady_clock::now() - start;
    interrupter.Join();
    sigaction(SIGUSR1, &previous, nullptr);
    EXPECT_GE(elapsed, std::chrono::milliseconds(200));
}

}  // namespace

}  // namespace kest::test::support
