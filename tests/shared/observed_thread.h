// SPDX-License-Identifier: MIT
// A thread that runs one function. A test can see that it sleeps on a futex, and interrupt it there.
//
// A test that only sleeps for a while cannot know that another thread waits by then; the kernel does.
#pragma once

#include <atomic>
#include <functional>
#include <string>
#include <thread>

/// Installs handlers for interrupt(): SIGUSR1 ends a sleep, SIGUSR2 (SA_RESTART) lets it go on.
void installInterruptHandlers();

class ObservedThread {
 public:
  explicit ObservedThread(std::function<void()> body);
  /// Waits for the body to return.
  ~ObservedThread();

  /// Waits until the thread sleeps on a futex. False when its body returned or a minute passed.
  bool isSeenAsleep() const;

  /// Sends the signal and waits until the kernel has delivered it.
  void interrupt(int signal);

  bool hasFinished() const { return finished; }

  /// Waits for the body to return. Fails the test and ends the process if that takes a minute.
  void join();

 private:
  std::string procFile(const char* name) const;
  bool sleepsOnFutex(std::string& call) const;

  std::atomic<int> id{0};
  std::atomic<bool> finished{false};
  std::thread thread;
};

/// Polls until the condition holds. False after a minute.
bool becomesTrue(const std::function<bool()>& condition);
