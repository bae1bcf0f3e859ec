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

namespace {

using vq::dsc::Mutex;
using vq::dsc::ScopedLock;
using vq::dsc::osdep::SleepMs;
using vq::dsc::osdep::Thread;

// Runs `body(argument)` on a Thread started with the function form and joins it.
template <class Body>
void RunOnThread(Body& body) {
    Thread thread;
    thread.Start([](void* argument) { (*static_cast<Body*>(argument))(); }, &body);
    thread.Join();
}

TEST(MutexTest, RecursionIsCountedAndExcludesOtherThreads) {
    Mutex mutex;
    mutex.Lock();
    ScopedLock again(mutex);
    EXPECT_EQ(mutex.RecursionCount(), 2u);
    EXPECT_TRUE(mutex.IsOwnedByCurrentThread());

    bool otherGotIt = true;
    bool otherOwns = true;
    auto tryFromOtherThread = [&] {
        otherOwns = mutex.IsOwnedByCurrentThread();
        otherGotIt = mutex.TryLock();
        if (otherGotIt) {
            mutex.Unlock();
        }
    };
    RunOnThread(tryFromOtherThread);
    EXPECT_FALSE(otherOwns);
    EXPECT_FALSE(otherGotIt);

    mutex.Unlock();
    EXPECT_EQ(mutex.RecursionCount(), 1u);
    RunOnThread(tryFromOtherThread);
    EXPECT_FALSE(otherGotIt) << "one level of recursion is still held";
}

TEST(MutexTest, ReleasedMutexPassesToAnotherThread) {
    Mutex mutex;
    { ScopedLock lock(mutex); }
    EXPECT_EQ(mutex.RecursionCount(), 0u);
    bool gotIt = false;
    uint32_t countInside = 0;
    auto lockFromOtherThread = [&] {
        gotIt = mutex.TryLock();
        countInside = mutex.RecursionCount();
        mutex.Unlock();
    };
    RunOnThread(lockFromOtherThread);
    EXPECT_TRUE(gotIt);
    EXPECT_EQ(countInside, 1u);
    EXPECT_FALSE(mutex.IsOwnedByCurrentThread());
}

TEST(MutexTest, UnlockByANonOwnerIsRefused) {
    Mutex mutex;
    EXPECT_THROW(mutex.Unlock(), vq::dsc::exception::InvalidOperation);
    mutex.Lock();
    auto unlockFromOtherThread = [&] {
        EXPECT_THROW(mutex.Unlock(), vq::dsc::exception::InvalidOperation);
    };
    RunOnThread(unlockFromOtherThread);
    EXPECT_EQ(mutex.RecursionCount(), 1u);
    mutex.Unlock();
}

TEST(MutexTest, BlockedLockWaitsForTheFullRelease) {
    Mutex mutex;
    std::atomic<bool> released{false};
    bool sawReleased = false;
    mutex.Lock();
    mutex.Lock();
    auto waiter = [&] {
        ScopedLock lock(mutex);
        sawReleased = released.load();
    };
    Thread thread;
    thread.Start([](void* argument) { (*static_cast<decltype(waiter)*>(argument))(); }, &waiter);
    SleepMs(20);
    mutex.Unlock();
    SleepMs(20);
    released = true;
    mutex.Unlock();
    thread.Join();
    EXPECT_TRUE(sawReleased);
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

TEST(ThreadTest, RunBodyGetsNameAndStackSize) {
    ProbeThread named;
    named.Start("ToggleNIC");
    named.Join();
    EXPECT_EQ(named.name, "ToggleNIC");
    EXPECT_GE(named.stackSize, Thread::kDefaultStackSize);

    ProbeThread large;
    large.Start("a-very-long-thread-name", 0x100000);
    large.Join();
    EXPECT_EQ(large.name, "a-very-long-thr");
    EXPECT_GE(large.stackSize, 0x100000u);
}

TEST(ThreadTest, SecondStartIsRefusedUntilJoined) {
    Thread thread;
    auto nothing = [](void*) {};
    thread.Start(nothing, nullptr);
    EXPECT_TRUE(thread.IsJoinable());
    EXPECT_THROW(thread.Start(nothing, nullptr), vq::dsc::exception::InvalidOperation);
    thread.Join();
    EXPECT_FALSE(thread.IsJoinable());
    EXPECT_NO_THROW(thread.Join());
}

TEST(ThreadTest, ExceptionInABodyDoesNotEndTheProcess) {
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

    const pthread_t sleeper = pthread_self();
    auto interrupt = [](void* target) {
        for (int i = 0; i < 5; ++i) {
            SleepMs(20);
            pthread_kill(*static_cast<pthread_t*>(target), SIGUSR1);
        }
    };
    Thread interrupter;
    pthread_t target = sleeper;
    const auto start = std::chrono::steady_clock::now();
    interrupter.Start(interrupt, &target);
    SleepMs(200);
    const auto elapsed = std::chrono::steady_clock::now() - start;
    interrupter.Join();
    sigaction(SIGUSR1, &previous, nullptr);
    EXPECT_GE(elapsed, std::chrono::milliseconds(200));
}

}  // namespace
