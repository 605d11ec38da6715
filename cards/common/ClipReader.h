// Runs FFmpeg beside a card and keeps a few pictures, and the sound that belongs to them, ready.
//
// One thread reads all of the child's pipes with poll. Pictures and sound are held back when enough is ready, but never while the
// card waits for the other of the two: FFmpeg writes them in turn, and would stand still with the one that nobody takes.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "cards/common/ClipInput.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <atomic>
#include <deque>
#include <memory>
#include <string>
#include <vector>

namespace VirtualCards
{

class VChildProcess;

class VClipReader
{
public:
  // i_bLoop: when the input ends it is begun again. i_bWait: a card that is due waits for its picture; otherwise it repeats the last one.
  VClipReader( VClipInput i_Input, const VPictureFormat& i_rFormat, bool i_bLoop, bool i_bWait );
  ~VClipReader();

  const VPictureFormat& Format() const { return m_Format; }

  // Waits until a picture is ready. False if none came within reasonable time or at all.
  bool WaitForPicture();

  // The next picture, by exchanging memory, and as many samples; what sound is missing is filled with silence. False without a
  // picture: the input has ended, or stands still. One thread at a time.
  bool Take( uint32_t i_Samples, VPicture& io_rPicture, std::vector<int32_t>& o_rSound );

  // The input has ended and will not begin again.
  bool HasEnded() const;

  // Any thread. Whoever waits comes back without a picture.
  void Close();

private:
  // One run of FFmpeg from the input's beginning to its end
  struct VPass
  {
    uint64_t m_Number = 0;
    std::vector<uint8_t> m_Sound;   // bytes as they came
    size_t m_SoundRead = 0;
    uint64_t m_SoundTotal = 0;   // bytes that ever came
    bool m_bSoundComplete = false;
  };
  struct VReady
  {
    uint64_t m_Pass = 0;
    VPicture m_Picture;
  };
  struct VRun;

  void Read();
  bool ReadPass( uint64_t i_Number );
  void PollOnce( VRun& io_rRun );
  void ReadPicture( VRun& io_rRun );
  void ReadSound( VRun& io_rRun );
  void EndPass( VRun& io_rRun );
  bool WantsPicture() const;
  bool WantsSound( const VRun& i_rRun ) const;
  void WakeReader();

  bool WaitForPictureLocked( boost::unique_lock<boost::mutex>& io_rLock, int i_Seconds );
  void TakePictureLocked( VPicture& io_rPicture );
  void TakeSound( boost::unique_lock<boost::mutex>& io_rLock, uint32_t i_Samples, std::vector<int32_t>& o_rSound );
  size_t SoundReadyLocked() const REQUIRES( m_Mutex );

  const VClipInput m_Input;
  const VPictureFormat m_Format;
  const bool m_bLoop;
  const bool m_bWait;
  const int m_Wake;   // an eventfd

  std::atomic<bool> m_bClosed{ false };

  mutable boost::mutex m_Mutex;
  boost::condition_variable m_Changed;
  std::deque<VReady> m_Ready GUARDED_BY( m_Mutex );
  std::vector<VPicture> m_Free GUARDED_BY( m_Mutex );
  std::deque<VPass> m_Passes GUARDED_BY( m_Mutex );
  uint64_t m_PassShown GUARDED_BY( m_Mutex ) = 0;
  bool m_bPictureAwaited GUARDED_BY( m_Mutex ) = false;
  bool m_bSoundAwaited GUARDED_BY( m_Mutex ) = false;
  bool m_bRepeating GUARDED_BY( m_Mutex ) = false;   // the front of m_Ready has been shown already
  bool m_bStalled GUARDED_BY( m_Mutex ) = false;
  bool m_bEnded GUARDED_BY( m_Mutex ) = false;

  boost::thread m_Thread;   // last: it uses all of the above
};

}
