// Work by several threads at a time, handed over in the order in which it was given.
//
// Starts another thread when more work waits than the running ones will soon begin.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <exception>
#include <functional>
#include <memory>
#include <mutex>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace tallowmere::cli {

template <class Piece>
class Crew {
 public:
  using Work = std::function<void(Piece&)>;

  // `hire` returns what one thread does with each of its pieces; from the second call on it may
  // return nothing, when there can be no more threads. `most` returns the largest number of threads
  // and is called once, when there is work for a second one. `handOver` gets each finished piece,
  // in Give or Finish.
  Crew(std::function<std::size_t()> most, std::function<Work()> hire,
       std::function<void(Piece&)> handOver)
      : mAskForMost(std::move(most)), mHire(std::move(hire)), mHandOver(std::move(handOver)) {}
  Crew(const Crew&) = delete;
  Crew& operator=(const Crew&) = delete;
  // Waits for the pieces in work; drops those behind them.
  ~Crew() {
    {
      const std::lock_guard lock(mMutex);
      mIsOver = true;
    }
    mWorkIsThere.notify_all();
    for (std::thread& thread : mThreads) thread.join();
  }

  // Returns when at most two pieces for each thread wait to be handed over. Throws what the work on
  // an earlier piece has thrown.
  void Give(Piece piece) {
    if (mThreads.empty() || (mTasks.size() >= kPiecesForOne * mThreads.size() && MayHire())) Hire();
    {
      const std::lock_guard lock(mMutex);
      mTasks.push_back(std::make_unique<Task>(std::move(piece)));
      mWaiting.push_back(mTasks.back().get());
    }
    mWorkIsThere.notify_one();
    while (!mTasks.empty() && (mTasks.size() > kPiecesForOne * mThreads.size() || IsFirstDone())) {
      HandOverFirst();
    }
  }

  // Returns when all pieces have been handed over.
  void Finish() {
    while (!mTasks.empty()) HandOverFirst();
  }

 private:
  // One that is worked on, and one to go on with.
  static constexpr std::size_t kPiecesForOne = 2;

  struct Task {
    explicit Task(Piece aPiece) : piece(std::move(aPiece)) {}

    Piece piece;
    bool isDone = false;
    std::exception_ptr fault;
  };

  bool MayHire() {
    if (mMost == 0) mMost = mAskForMost();
    return mThreads.size() < mMost;
  }

  // Keeps to the threads that already run when the system refuses another one.
  void Hire() {
    try {
      if (const Work work = mHire()) {
        mThreads.emplace_back([this, work] { Run(work); });
        return;
      }
    } catch (const std::system_error&) {
      if (mThreads.empty()) throw;
    }
    mMost = mThreads.size();
  }

  void Run(const Work& work) {
    std::unique_lock lock(mMutex);
    while (true) {
      mWorkIsThere.wait(lock, [this] { return mIsOver || !mWaiting.empty(); });
      if (mIsOver) return;
      Task& task = *mWaiting.front();
      mWaiting.pop_front();
      lock.unlock();
      try {
        work(task.piece);
      } catch (...) {
        task.fault = std::current_exception();
      }
      lock.lock();
      task.isDone = true;
      mSomeIsDone.notify_one();
    }
  }

  bool IsFirstDone() {
    const std::lock_guard lock(mMutex);
    return mTasks.front()->isDone;
  }

  void HandOverFirst() {
    {
      std::unique_lock lock(mMutex);
      mSomeIsDone.wait(lock, [this] { return mTasks.front()->isDone; });
    }
    const std::unique_ptr<Task> first = std::move(mTasks.front());
    mTasks.pop_front();
    if (first->fault) std::rethrow_exception(first->fault);
    mHandOver(first->piece);
  }

  std::function<std::size_t()> mAskForMost;
  std::size_t mMost = 0;  // 0: not asked yet
  std::function<Work()> mHire;
  std::function<void(Piece&)> mHandOver;
  std::vector<std::thread> mThreads;
  std::deque<std::unique_ptr<Task>> mTasks;  // not handed over yet
  std::mutex mMutex;
  std::condition_variable mWorkIsThere;
  std::condition_variable mSomeIsDone;
  std::deque<Task*> mWaiting;  // not begun yet
  bool mIsOver = false;
};

}  // namespace tallowmere::cli
