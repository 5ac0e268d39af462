// SPDX-License-Identifier: MIT
// A thread that runs one body, and can be seen asleep on a futex and be interrupted there.
//
// Sleeping for a while in a test proves nothing about who waits; asking the kernel does.
#pragma once

#include <atomic>
#include <functional>
#include <string>
#include <thread>

/// Signal handlers for interrupt(): SIGUSR1 cuts a sleep short, SIGUSR2 (SA_RESTART) lets it go on.
void installInterruptHandlers();

class ObservedThread {
 public:
  explicit ObservedThread(std::function<void()> body);
  /// Waits for the body to return.
  ~ObservedThread();

  /// Waits until the thread sleeps on a futex. False when its body returned or ten seconds passed.
  bool isSeenAsleep() const;

  /// Sends the signal and waits until the kernel has delivered it.
  void interrupt(int signal);

  bool hasFinished() const { return finished; }

  /// Waits for the body to return. Fails the test and ends the process if that takes ten seconds.
  void join();

 private:
  std::string procFile(const char* name) const;
  bool sleepsOnFutex(std::string& call) const;

  std::atomic<int> id{0};
  std::atomic<bool> finished{false};
  std::thread thread;
};

/// Polls until the condition holds. False after ten seconds.
bool becomesTrue(const std::function<bool()>& condition);
