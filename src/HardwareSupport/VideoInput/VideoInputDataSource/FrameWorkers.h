// Writes frames of files whose writer takes several at once: each frame is a job, jobs begin in the order in which they were added, and only
// so many are under way at a time.
//
// Add and the questions are for the owner's thread; the jobs run on the service's threads.
#pragma once

#include "NotificationSystem/IPostalService.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace VideoInputHAL
{

// What became of a frame in a file.
struct VFrameOutcome
{
  uint64_t m_Key = 0;
  bool m_bWritten = false;
  uint64_t m_Bytes = 0;    // of video, as the writer stored it
  std::string m_Error{};   // why it did not come as far as the writer; empty otherwise
};

class VFrameWorkers
{
public:
  using VJob = std::function<VFrameOutcome()>;

  // i_File tells the outcomes of one owner's files apart.
  struct VDone
  {
    size_t m_File;
    VFrameOutcome m_Outcome;
  };

  // i_Room is the number of jobs that may be under way, from Add to the owner's TakeDone. i_OnDone is called after each job, on its thread,
  // also once this object has gone.
  VFrameWorkers( std::shared_ptr<KVZ::IPostalService> i_pService, size_t i_Room, std::function<void()> i_OnDone );
  // Drops and waits.
  ~VFrameWorkers();

  bool HasRoom() const;
  bool IsIdle() const;
  // The job must not throw.
  void Add( size_t i_File, VJob i_Job );
  // What has ended since the last call, in no order.
  std::vector<VDone> TakeDone();
  // Forgets the jobs that have not begun, which are the newest, and waits for those that have.
  void DropAndWait();

private:
  class VState;

  const std::shared_ptr<KVZ::IPostalService> m_pService;
  const size_t m_Room;
  const std::shared_ptr<VState> m_pState;   // outlives this while something posted has not run
};

}
