// Changes the tree while requests are served, and records its history.
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "History.h"
#include "Model.h"

namespace tallowmere::soak {

// The tree in the root folder of a volume, and a thread that changes it.
class Churner {
 public:
  // REQUIRES: a separate file system is mounted at `folder`, and the process is in a mount
  // namespace of its own.
  Churner(std::string folder, std::uint64_t seed, unsigned pause);
  Churner(const Churner&) = delete;
  Churner& operator=(const Churner&) = delete;
  ~Churner();  // stops

  void Start();
  void Stop();

  const History& Changes() const { return mHistory; }
  const std::vector<std::uint64_t>& CountOfEachKind() const { return mCounts; }
  static const std::vector<const char*>& Kinds();

 private:
  State FirstState();
  void Run();
  bool ChangeSomething(std::size_t kind);
  void Change(const State& next, const std::function<int()>& call);
  void Make(const State& next, const std::string& path, const std::function<int()>& call);

  const State& Now() const { return mHistory.At(mHistory.Reached()); }
  const Entry& EntryOf(Node folder) const;
  bool IsOnOther(Node folder) const;
  std::string PathOf(Node folder) const;
  std::string PathOf(Node folder, NameIndex name) const;
  std::size_t Below(std::size_t end) { return mRandom() % end; }
  const Entry* AnyEntry(const std::function<bool(const Entry&)>& isWanted);
  NameIndex AnyFileName();
  bool HasRoom() const { return Now().count + 8 < Now().entries.size(); }

  bool MakeFile();
  bool RemoveAny(Kind kind);
  bool RemoveFile();
  bool MoveFile();
  bool LinkFile();
  bool MakeInnerLink();
  bool MoveFolder();
  bool ExchangeFolders();
  bool ReplaceFolderByLink();
  bool MakeOuterLink();
  bool RemoveLink();
  bool MoveSubfolder();
  bool MakeFolder();
  bool RemoveFolder();
  bool MountOrUnmount();
  bool Mount();
  bool Unmount();

  std::string mFolder;
  std::mt19937_64 mRandom;
  unsigned mPause;
  bool mCanExchange = false;  // not every file system supports it
  Node mNextNode = kMainRoot + 1;
  History mHistory;
  std::vector<std::uint64_t> mCounts;
  std::atomic<bool> mIsToStop{false};
  std::thread mThread;
};

}  // namespace tallowmere::soak
