#include "cards/common/ClipReader.h"

#include "StageCoreRuntime/DebugServices.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "cards/common/ChildProcess.h"
#include "cards/common/SampleCadence.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <poll.h>
#include <sys/eventfd.h>
#include <unistd.h>

namespace VirtualCards
{

namespace
{

constexpr size_t PicturesReady = 6;   // enough to bridge the start of the next pass
constexpr size_t MostPictures = 64;   // while sound is awaited
constexpr uint64_t SoundReadySamples = 2 * AudioRate;
constexpr uint64_t MostLiveSamples = AudioRate / 2;   // what a live input runs ahead beyond this is left out
constexpr int PatienceSeconds = 20;
constexpr size_t MostErrorText = 65536;
constexpr size_t CompactAbove = 1 << 20;   // bytes of sound already taken

}

// What one pass needs on the reading thread.
struct VClipReader::VRun
{
  std::unique_ptr<VChildProcess> m_pChild;
  int m_Pictures = -1;   // pipes; -1 once they have ended
  int m_Sound = -1;
  int m_Errors = -1;
  VPicture m_Picture;   // being filled
  size_t m_Filled = 0;
  uint64_t m_Count = 0;   // whole pictures
  std::string m_ErrorText;
};

VClipReader::VClipReader( VClipInput i_Input, const VPictureFormat& i_rFormat, bool i_bLoop, bool i_bWait )
  : m_Input( std::move( i_Input ) ),
    m_Format( i_rFormat ),
    m_bLoop( i_bLoop ),
    m_bWait( i_bWait ),
    m_Wake( eventfd( 0, EFD_CLOEXEC | EFD_NONBLOCK ) ),
    m_Thread( [this] { Read(); } )
{
}

VClipReader::~VClipReader()
{
  Close();
  m_Thread.join();
  close( m_Wake );
}

void VClipReader::Close()
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bClosed = true;
  }
  m_Changed.notify_all();
  WakeReader();
}

bool VClipReader::HasEnded() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_bEnded && m_Ready.empty();
}

bool VClipReader::WaitForPicture() NO_LOCK_ANALYSIS
{
  boost::unique_lock<boost::mutex> Lock( m_Mutex );
  return WaitForPictureLocked( Lock, PatienceSeconds );
}

bool VClipReader::Take( uint32_t i_Samples, VPicture& io_rPicture, std::vector<int32_t>& o_rSound ) NO_LOCK_ANALYSIS
{
  {
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    const bool bPatient = m_bWait && !m_bStalled;
    m_bStalled = !WaitForPictureLocked( Lock, bPatient ? PatienceSeconds : 0 );
    if( m_bStalled || m_bClosed )
    {
      return false;
    }
    TakePictureLocked( io_rPicture );
    TakeSound( Lock, i_Samples, o_rSound );
  }
  WakeReader();
  return true;
}

bool VClipReader::WaitForPictureLocked( boost::unique_lock<boost::mutex>& io_rLock, int i_Seconds ) NO_LOCK_ANALYSIS
{
  const auto IsOver = [this]() NO_LOCK_ANALYSIS { return !m_Ready.empty() || m_bEnded || m_bClosed; };
  if( !IsOver() && i_Seconds > 0 )
  {
    m_bPictureAwaited = true;
    WakeReader();
    m_Changed.wait_for( io_rLock, boost::chrono::seconds( i_Seconds ), IsOver );
    m_bPictureAwaited = false;
  }
  return !m_Ready.empty();
}

void VClipReader::TakePictureLocked( VPicture& io_rPicture ) NO_LOCK_ANALYSIS
{
  if( m_bRepeating && m_Ready.size() > 1 )
  {
    m_Free.push_back( std::move( m_Ready.front().m_Picture ) );
    m_Ready.pop_front();
  }
  VReady& rFront = m_Ready.front();
  m_PassShown = rFront.m_Pass;
  m_bRepeating = !m_bWait && m_Ready.size() == 1 && !m_bEnded;
  if( m_bRepeating )
  {
    // Nothing newer yet: it stays, in case the next frame is due before something has come
    std::memcpy( io_rPicture.Bytes( m_Format.Size() ), rFront.m_Picture.Bytes( m_Format.Size() ), m_Format.Size() );
    io_rPicture.m_Background = 0;
    return;
  }
  io_rPicture.Swap( rFront.m_Picture );
  m_Free.push_back( std::move( rFront.m_Picture ) );
  m_Ready.pop_front();
}

size_t VClipReader::SoundReadyLocked() const
{
  const auto Pass = std::find_if( m_Passes.begin(), m_Passes.end(),
    [this]( const VPass& i_rPass ) NO_LOCK_ANALYSIS { return i_rPass.m_Number == m_PassShown; } );
  return Pass == m_Passes.end() ? 0 : Pass->m_Sound.size() - Pass->m_SoundRead;
}

void VClipReader::TakeSound( boost::unique_lock<boost::mutex>& io_rLock, uint32_t i_Samples, std::vector<int32_t>& o_rSound ) NO_LOCK_ANALYSIS
{
  const size_t FrameBytes = sizeof( int32_t ) * m_Input.m_AudioChannels;
  o_rSound.assign( size_t{ i_Samples } * m_Input.m_AudioChannels, 0 );
  while( !m_Passes.empty() && m_Passes.front().m_Number < m_PassShown )
  {
    m_Passes.pop_front();
  }
  if( m_Input.m_AudioChannels == 0 || m_Passes.empty() )
  {
    return;
  }
  const size_t Wanted = i_Samples * FrameBytes;
  const auto IsOver = [&]() NO_LOCK_ANALYSIS { return SoundReadyLocked() >= Wanted || m_Passes.front().m_bSoundComplete || m_bClosed; };
  if( m_bWait && !IsOver() )
  {
    m_bSoundAwaited = true;
    WakeReader();
    m_Changed.wait_for( io_rLock, boost::chrono::seconds( PatienceSeconds ), IsOver );
    m_bSoundAwaited = false;
  }
  VPass& rPass = m_Passes.front();
  size_t Ready = SoundReadyLocked() / FrameBytes * FrameBytes;
  if( !m_bWait && Ready > Wanted + MostLiveSamples * FrameBytes )
  {
    rPass.m_SoundRead += Ready - Wanted;
    Ready = Wanted;
  }
  const size_t Taken = std::min( Ready, Wanted );
  if( Taken > 0 )
  {
    std::memcpy( o_rSound.data(), rPass.m_Sound.data() + rPass.m_SoundRead, Taken );
    rPass.m_SoundRead += Taken;
  }
}

void VClipReader::WakeReader()
{
  const uint64_t One = 1;
  [[maybe_unused]] const ssize_t Written = write( m_Wake, &One, sizeof( One ) );   // fails only if it is awake already
}

void VClipReader::Read()
{
  const DebugServices::VCrashHandlerForThread CrashHandler;
  DebugServices::SetThreadName( "Clip Reader" );
  bool bPictures = true;
  for( uint64_t Pass = 1; bPictures && !m_bClosed && ( Pass == 1 || m_bLoop ); ++Pass )
  {
    bPictures = ReadPass( Pass );
  }
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bEnded = true;
  }
  m_Changed.notify_all();
}

bool VClipReader::ReadPass( uint64_t i_Number )
{
  VRun Run;
  std::vector<int> Descriptors{ STDOUT_FILENO, STDERR_FILENO };
  if( m_Input.m_AudioChannels > 0 )
  {
    Descriptors.push_back( ClipSoundDescriptor );
  }
  Run.m_pChild = VChildProcess::Start( ClipCommand( m_Input, m_Format ), Descriptors, Run.m_ErrorText );
  if( !Run.m_pChild )
  {
    KVZ_LOG_ERROR( "VirtualCards", "%1%", Run.m_ErrorText );
    return false;
  }
  Run.m_Pictures = Run.m_pChild->Pipe( 0 );
  Run.m_Errors = Run.m_pChild->Pipe( 1 );
  Run.m_Sound = Descriptors.size() > 2 ? Run.m_pChild->Pipe( 2 ) : -1;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Passes.emplace_back();
    m_Passes.back().m_Number = i_Number;
  }
  while( !m_bClosed && ( Run.m_Pictures >= 0 || Run.m_Sound >= 0 ) )
  {
    PollOnce( Run );
  }
  EndPass( Run );
  return Run.m_Count > 0;
}

bool VClipReader::WantsPicture() const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Ready.size() < PicturesReady || ( m_bSoundAwaited && m_Ready.size() < MostPictures );
}

bool VClipReader::WantsSound( const VRun& i_rRun ) const
{
  const boost::lock_guard<boost::mutex> Lock( m_Mutex );
  const VPass& rPass = m_Passes.back();
  const uint64_t Ready = ( rPass.m_Sound.size() - rPass.m_SoundRead ) / ( sizeof( int32_t ) * m_Input.m_AudioChannels );
  return Ready < SoundReadySamples || m_bPictureAwaited || i_rRun.m_Pictures < 0;
}

void VClipReader::PollOnce( VRun& io_rRun )
{
  const bool bPicture = io_rRun.m_Pictures >= 0 && WantsPicture();
  const bool bSound = io_rRun.m_Sound >= 0 && WantsSound( io_rRun );
  std::array<pollfd, 4> Polls = { pollfd{ m_Wake, POLLIN, 0 }, pollfd{ io_rRun.m_Errors, POLLIN, 0 },
    pollfd{ bPicture ? io_rRun.m_Pictures : -1, POLLIN, 0 }, pollfd{ bSound ? io_rRun.m_Sound : -1, POLLIN, 0 } };
  poll( Polls.data(), Polls.size(), -1 );
  if( Polls[0].revents != 0 )
  {
    uint64_t Count = 0;
    [[maybe_unused]] const ssize_t Got = read( m_Wake, &Count, sizeof( Count ) );
  }
  if( Polls[1].revents != 0 )
  {
    std::array<char, 4096> Text;
    const ssize_t Got = read( io_rRun.m_Errors, Text.data(), Text.size() );
    io_rRun.m_Errors = Got == 0 ? -1 : io_rRun.m_Errors;
    if( Got > 0 && io_rRun.m_ErrorText.size() < MostErrorText )
    {
      io_rRun.m_ErrorText.append( Text.data(), static_cast<size_t>( Got ) );
    }
  }
  if( Polls[2].revents != 0 )
  {
    ReadPicture( io_rRun );
  }
  if( Polls[3].revents != 0 )
  {
    ReadSound( io_rRun );
  }
}

void VClipReader::ReadPicture( VRun& io_rRun )
{
  const size_t Size = m_Format.Size();
  uint8_t* pBytes = io_rRun.m_Picture.Bytes( Size );
  const ssize_t Got = read( io_rRun.m_Pictures, pBytes + io_rRun.m_Filled, Size - io_rRun.m_Filled );
  if( Got <= 0 )
  {
    io_rRun.m_Pictures = Got == 0 || ( errno != EAGAIN && errno != EINTR ) ? -1 : io_rRun.m_Pictures;
    return;
  }
  io_rRun.m_Filled += static_cast<size_t>( Got );
  if( io_rRun.m_Filled < Size )
  {
    return;
  }
  io_rRun.m_Filled = 0;
  ++io_rRun.m_Count;
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Ready.push_back( { m_Passes.back().m_Number, std::move( io_rRun.m_Picture ) } );
    io_rRun.m_Picture = VPicture();
    if( !m_Free.empty() )
    {
      io_rRun.m_Picture.Swap( m_Free.back() );
      m_Free.pop_back();
    }
  }
  m_Changed.notify_all();
}

void VClipReader::ReadSound( VRun& io_rRun )
{
  std::array<uint8_t, 65536> Bytes;
  const ssize_t Got = read( io_rRun.m_Sound, Bytes.data(), Bytes.size() );
  bool bEnd = Got == 0 || ( Got < 0 && errno != EAGAIN && errno != EINTR );
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    VPass& rPass = m_Passes.back();
    if( Got > 0 )
    {
      if( rPass.m_SoundRead > CompactAbove )
      {
        rPass.m_Sound.erase( rPass.m_Sound.begin(), rPass.m_Sound.begin() + static_cast<ptrdiff_t>( rPass.m_SoundRead ) );
        rPass.m_SoundRead = 0;
      }
      rPass.m_Sound.insert( rPass.m_Sound.end(), Bytes.begin(), Bytes.begin() + Got );
      rPass.m_SoundTotal += static_cast<uint64_t>( Got );
    }
    // Sound beyond the last picture is never heard
    const uint64_t Heard = SamplesUntil( io_rRun.m_Count, m_Format.m_pStandard->m_Period ) + AudioRate / 10;
    bEnd = bEnd || ( io_rRun.m_Pictures < 0 && rPass.m_SoundTotal >= Heard * sizeof( int32_t ) * m_Input.m_AudioChannels );
  }
  io_rRun.m_Sound = bEnd ? -1 : io_rRun.m_Sound;
  m_Changed.notify_all();
}

void VClipReader::EndPass( VRun& io_rRun )
{
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Passes.back().m_bSoundComplete = true;
  }
  m_Changed.notify_all();
  if( !m_bClosed && !io_rRun.m_ErrorText.empty() )
  {
    KVZ_LOG_ERROR( "VirtualCards", "FFmpeg: %1%", LastLine( io_rRun.m_ErrorText ) );
  }
  io_rRun.m_pChild.reset();
}

}
