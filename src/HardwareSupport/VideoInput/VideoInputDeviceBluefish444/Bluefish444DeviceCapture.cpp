// The capture thread: orders, set-up of the card, and the rhythm of syncs and buffers.
//
// The card fills a buffer from the sync after the one at which it was named, and it is whole at the sync after that. So of the three buffers one is
// named, one is being filled and one is read at any time, and each round lasts one frame:
//
//   sync k      name buffer n                       (the card begins to fill it at sync k + 1)
//   sync k + 1  read buffer n - 1, named at k - 1   then the next round begins at this same sync
//
// The sync that ends a round begins the next: to wait once more would let every other frame pass by.
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444DeviceImpl.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Tables.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "Utils/UtilsMemory/LockedMemory.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <utility>

namespace VideoInputHAL
{

namespace
{

namespace Property = BlueVelvet::Property;
namespace Buffer = BlueVelvet::Buffer;

constexpr uint32_t BufferCount = 3;
constexpr uint64_t FieldsPerFrame = 2;
constexpr std::chrono::milliseconds NoSignalPause( 1000 );

}

void VBluefish444Device::VImpl::Run()
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( m_DisplayName );
  m_pHanc = static_cast<uint8_t*>( UtilsMemory::AllocateLocked( BlueVelvet::HancBytes ) );
  if( !m_pHanc )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Memory allocation failed." );
  }
  while( m_pHanc && !IsStopping() )
  {
    RunRound();
  }
  UtilsMemory::FreeLocked( m_pHanc, BlueVelvet::HancBytes );
  m_pCard.reset();
}

void VBluefish444Device::VImpl::RunRound()
{
  TakeCommand();
  if( m_bSetUpDue )
  {
    SetUp();
  }
  if( !BeginRound() )
  {
    LoseCard();
    return;
  }
  const std::optional<uint32_t> Readable = m_NamedBuffer;
  const uint32_t Named = m_NextBuffer;
  m_NamedBuffer = Named;
  m_NextBuffer = ( m_NextBuffer + 1 ) % BufferCount;
  m_pCard->CaptureInto( Named );
  m_pCard->CaptureInto( Named | Buffer::Hanc );
  if( FollowMode() )
  {
    return;
  }
  if( m_Mode == m_NoSignalMode )
  {
    Pause();
    return;
  }
  // The signal may have changed during the frame: then what it left is of no known format, and the next round takes the change up.
  if( !WaitForSync() || !m_Command.m_bStart || ReadMode() != m_Mode )
  {
    return;
  }
  // Should the next round come late, this buffer takes the frames until then.
  m_pCard->CaptureInto( Named | Buffer::ImageHanc );
  if( Readable )
  {
    DeliverFrame( *Readable );
  }
}

void VBluefish444Device::VImpl::TakeCommand()
{
  const bool bFormerStart = m_Command.m_bStart;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Commands.empty() )
    {
      return;
    }
    m_Command = m_Commands.front();
    m_Commands.pop_front();
    m_bCapturing = m_Command.m_bStart;
  }
  m_bSetUpDue = true;
  if( bFormerStart != m_Command.m_bStart )
  {
    m_StatusChanged();
  }
}

void VBluefish444Device::VImpl::SetUp()
{
  const uint32_t Mode = m_Mode;
  const uint32_t MemoryFormat = ToMemoryFormat( m_Command.m_PixelFormat );
  m_pCard->Set( Property::VideoDualLinkInput, 0 );
  m_pCard->Set( Property::VideoDualLinkInputSignalFormatType, BlueVelvet::SignalFormatIndependent422 );
  m_pCard->StopVideoCapture();
  m_pCard->Set( Property::RoutingMatrix, ChannelRouting( m_Channel ) );
  m_pCard->Set( Property::VideoInputUpdateType, BlueVelvet::UpdateMethod::Frame );
  m_pCard->Set( Property::VideoInputMemoryFormat, MemoryFormat );

  const BlueVelvet::VFlatFunctions& rFunctions = m_pCard->Functions();
  m_Setup = {};
  m_Setup.m_pStandard = KVZ::FindVideoStandard( StandardOf( Mode ) );
  m_Setup.m_GoldenBytes = BlueVelvet::BlueVelvetGolden( rFunctions, Mode, MemoryFormat, BlueVelvet::UpdateMethod::Frame );
  m_Setup.m_Image.m_ImageWidth = BlueVelvet::BlueVelvetLinePixels( rFunctions, Mode );
  m_Setup.m_Image.m_ImageHeight = BlueVelvet::BlueVelvetFrameLines( rFunctions, Mode, BlueVelvet::UpdateMethod::Frame );
  m_Setup.m_Image.m_PixelFormat = m_Command.m_PixelFormat;
  m_Setup.m_ImageBytes = uint64_t{ BlueVelvet::BlueVelvetLineBytes( rFunctions, Mode, MemoryFormat ) } * m_Setup.m_Image.m_ImageHeight;
  m_Record = {};
  m_NamedBuffer.reset();   // what was named before holds a frame of another kind
  m_bSynced = false;
  m_bSetUpDue = false;
  if( Mode != m_NoSignalMode )
  {
    m_Setup.m_Image.m_InterlacedFormat = KVZ::GetInterlacedFormat( m_Setup.m_pStandard->m_Standard );
    WaitUnlessStopping();
    m_pCard->Set( Property::VideoInputEngine, BlueVelvet::VideoEngine::FrameStore );
  }
}

// So the thread's end waits for one sync at most, wherever it finds the thread.
std::optional<uint64_t> VBluefish444Device::VImpl::WaitUnlessStopping() { return IsStopping() ? std::nullopt : m_pCard->WaitForInputSync(); }

// False where the card is lost, or the thread is to end.
bool VBluefish444Device::VImpl::BeginRound()
{
  m_bSynced = m_bSynced || WaitUnlessStopping().has_value();
  return m_bSynced;
}

// A card that does not wait shows nothing either.
void VBluefish444Device::VImpl::LoseCard()
{
  if( !IsStopping() )
  {
    SetMode( m_NoSignalMode );
    Pause();
  }
}

bool VBluefish444Device::VImpl::FollowMode()
{
  const uint32_t Mode = ReadMode();
  if( Mode == m_Mode )
  {
    return false;
  }
  SetMode( Mode );
  return true;
}

// A card that does not tell has no signal.
uint32_t VBluefish444Device::VImpl::ReadMode() { return m_pCard->Query( Property::VideoInputSignalVideoMode ).value_or( m_NoSignalMode ); }

void VBluefish444Device::VImpl::SetMode( uint32_t i_Mode )
{
  m_bSetUpDue = true;
  if( m_Mode.exchange( i_Mode ) == i_Mode )
  {
    return;
  }
  m_VideoStandardChanged();
  bool bTimecodeLost = false;
  if( i_Mode == m_NoSignalMode )
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    bTimecodeLost = LoseTimecode();
  }
  if( bTimecodeLost )
  {
    m_TimecodeChanged();
  }
}

void VBluefish444Device::VImpl::Pause() NO_LOCK_ANALYSIS
{
  m_bSynced = false;
  m_NamedBuffer.reset();
  if( m_Pause && !IsStopping() )
  {
    m_Pause( NoSignalPause );
    return;
  }
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  m_Stopping.wait_for( Lock, boost::chrono::milliseconds( NoSignalPause.count() ), [this]() NO_LOCK_ANALYSIS { return m_bStop; } );
}

// The sync that ends this round. Where it fails, the next round finds out.
bool VBluefish444Device::VImpl::WaitForSync()
{
  const std::optional<uint64_t> FieldCount = WaitUnlessStopping();
  m_bSynced = FieldCount.has_value();
  if( FieldCount )
  {
    CountDroppedFrames( *FieldCount );
  }
  return m_bSynced;
}

// The first count of all is the card's whole running time. One that goes back misses nothing.
void VBluefish444Device::VImpl::CountDroppedFrames( uint64_t i_FieldCount )
{
  const uint64_t Last = std::exchange( m_LastFieldCount, i_FieldCount );
  if( i_FieldCount > Last + FieldsPerFrame )
  {
    m_DroppedFrames( static_cast<unsigned int>( ( i_FieldCount - Last - FieldsPerFrame ) / FieldsPerFrame ) );
  }
}

}
