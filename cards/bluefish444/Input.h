// One input channel of a virtual card: its signal, its clock, and the buffers that its frames go into.
//
// A sync is the moment between two frames of the signal. At each, the frame that has just come stands in the buffer that was named for it, and the
// buffer that was named last before this sync begins to take the next. A name stays in force until another comes: with none, the same buffer is
// filled again and again. So what is named after one sync can be read after the next but one. Without a signal nothing is filled, while the syncs
// go on at the card's own pace.
//
// A client that polls is given up to two seconds a frame before the next one passes or the card is taken out, as any virtual card waits for a slow
// client; after that the frame is lost to it. It is not waited for where it captures nothing, nor while there is no signal, once it has asked for
// the mode and so knows.
//
// Any thread may call.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "VendorInterfaces/BlueVelvet.h"
#include "cards/common/CapturedFrame.h"
#include "cards/common/CardParts.h"
#include "cards/common/CardRunner.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>

#include <array>
#include <map>
#include <memory>
#include <optional>
#include <vector>

namespace VirtualCards
{

class VBluefishInput final : public ICardFrames
{
public:
  // i_Index counts from 0, for input A.
  VBluefishInput( uint32_t i_Index, const VCardParts& i_rParts, const VPaceSettings& i_rSettings );
  ~VBluefishInput() override;

  void Begin();
  void End();
  VCardRunner& Runner() { return m_Runner; }
  const VCardRunner& Runner() const { return m_Runner; }
  VCardCounters Counters() const;

  // What a client calls. False is a failure; all fail while the card is out of the machine.
  bool Query( int i_Property, uint32_t& o_rValue );
  // False also for a value that the card does not take.
  bool Set( int i_Property, uint32_t i_Value );
  bool StopCapture();
  bool WaitForSync( uint64_t& o_rFieldCount );
  // False also for a buffer that the card does not have, and while the input is not routed to the frame store.
  bool Capture( uint32_t i_BufferId );
  bool Read( uint8_t* o_pTarget, uint64_t i_Size, uint32_t i_BufferId, uint64_t i_Offset );
  // The client has gone.
  void Leave();

  void OnPresence( bool i_bPresent ) override;
  void OnFrame( const VSignalFrame& i_rFrame ) override;

private:
  static constexpr uint32_t BufferCount = 8;
  using VFramePointer = std::shared_ptr<VCapturedFrame>;

  // What a buffer holds, and what a capture fills: its image, its ancillary data, or both.
  struct VBuffer
  {
    VFramePointer m_pImage;
    VFramePointer m_pHanc;
  };
  struct VTargets
  {
    std::optional<uint32_t> m_Image;
    std::optional<uint32_t> m_Hanc;
  };

  bool IsUsableLocked() const REQUIRES( m_Mutex ) { return m_bPresent && !m_bEnded; }
  bool IsRoutedLocked() const REQUIRES( m_Mutex );
  uint32_t Routing() const;
  uint32_t DetectedModeLocked() REQUIRES( m_Mutex );
  VFramePointer FreeFrameLocked() REQUIRES( m_Mutex );
  void HoldForClient();
  bool PlanFrame( const VSignalFrame& i_rFrame, VPictureFormat& o_rFormat, VFramePointer& o_rpFrame );
  void PassSync( const VSignalFrame& i_rFrame, bool i_bSignal, const VFramePointer& i_pFrame );

  const uint32_t m_Index;
  const VSignalSource m_Source;
  bool m_bShown = true;   // what was last asked for was there: it is no more when a clip has ended. Card's thread

  mutable boost::mutex m_Mutex;
  boost::condition_variable m_Sync;
  boost::condition_variable m_ClientWaits;
  bool m_bEnded GUARDED_BY( m_Mutex ) = false;
  bool m_bPresent GUARDED_BY( m_Mutex );
  std::map<int, uint32_t> m_Properties GUARDED_BY( m_Mutex );   // as set

  // The signal, as of the last sync
  uint64_t m_Syncs GUARDED_BY( m_Mutex ) = 0;
  uint64_t m_FieldCount GUARDED_BY( m_Mutex ) = 0;
  bool m_bSignal GUARDED_BY( m_Mutex ) = false;
  const KVZ::VVideoStandardRow* m_pStandard GUARDED_BY( m_Mutex );
  uint32_t m_LastToldMode GUARDED_BY( m_Mutex );

  // The client
  uint32_t m_Waiting GUARDED_BY( m_Mutex ) = 0;    // for the next sync
  bool m_bInRound GUARDED_BY( m_Mutex ) = false;   // it has had a sync and will wait for the next
  VTargets m_Named GUARDED_BY( m_Mutex );
  VTargets m_Filling GUARDED_BY( m_Mutex );
  std::array<VBuffer, BufferCount> m_Buffers GUARDED_BY( m_Mutex );
  std::vector<VFramePointer> m_Frames GUARDED_BY( m_Mutex );   // one that nobody else holds is free
  VCardCounters m_Counters GUARDED_BY( m_Mutex );

  VCardRunner m_Runner;   // last: it calls this object
};

}
