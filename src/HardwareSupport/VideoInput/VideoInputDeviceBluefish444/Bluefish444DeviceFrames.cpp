// The road of a frame from the card's buffer to the data callback, on the capture thread.
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444DeviceImpl.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Tables.h"
#include "HardwareSupport/VideoInput/VideoInputDeviceBluefish444/Bluefish444Timecode.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <boost/thread/lock_guard.hpp>

#include <algorithm>

namespace VideoInputHAL
{

namespace
{

namespace Buffer = BlueVelvet::Buffer;

}

void VBluefish444Device::VImpl::DeliverFrame( uint32_t i_Buffer )
{
  std::shared_ptr<IVideoInputAllocator> pAllocator;
  std::shared_ptr<IVideoInputDataCallback> pReceiver;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pAllocator = m_pAllocator;
  }
  const uint64_t Samples = SamplesPerFrame( m_Setup.m_pStandard->m_Period );
  const uint64_t Channels = std::min( m_Command.m_AudioChannels, MostAudioChannels );
  VVideoInputDataSourceFrame* const pFrame = MakeFrame( pAllocator.get(), m_Setup.m_Image, m_Setup.m_ImageBytes,
    Samples * Channels * ToSampleType( m_Command.m_AudioFormat ).m_Bytes );
  if( !pFrame )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Memory allocation failed." );
    return;
  }
  pFrame->m_DeviceIndex = GetDeviceIndex();
  if( !ReadFrame( i_Buffer, *pFrame ) )
  {
    pAllocator->Free( pFrame );
    return;
  }
  ResolveRepeats( pFrame->m_Timecode );
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    pReceiver = m_pDataCallback.lock();
  }
  const int64_t Period = m_Setup.m_pStandard->m_Period;
  if( !pReceiver || !pReceiver->OnVideoInputData( m_FrameIndex++, pFrame, &pFrame->m_Timecode, &Period ) )
  {
    pAllocator->Free( pFrame );
  }
}

// False, with a line in the log, where the card does not give its buffer.
bool VBluefish444Device::VImpl::ReadFrame( uint32_t i_Buffer, VVideoInputDataSourceFrame& io_rFrame )
{
  // The image first: its rounded end reaches over the place of the samples.
  const uint64_t ReadBytes = std::min<uint64_t>( m_Setup.m_GoldenBytes, io_rFrame.m_ImageCapacity );
  if( ReadBytes == 0 || ReadBytes < m_Setup.m_ImageBytes ||
    !m_pCard->ReadBuffer( io_rFrame.Image(), ReadBytes, i_Buffer | Buffer::ImageHanc | Buffer::DataImage ) )
  {
    KVZ_LOG( Bluefish444LogCategory, 2, "Could not read a frame of %1% from the card.", m_DisplayName );
    return false;
  }
  Decode( i_Buffer, io_rFrame );
  return true;
}

void VBluefish444Device::VImpl::PrepareRecord( uint8_t* o_pSamples )
{
  m_Record.m_pSamples = o_pSamples;
  m_Record.m_MostSamples = SamplesPerFrame( m_Setup.m_pStandard->m_Period );
  m_Record.m_ChannelMask = m_Record.m_MostSamples == 0 ? 0 : ChannelMask( m_Command.m_AudioChannels );   // nothing is wanted where there is no room
  m_Record.m_SampleFlags = ToSampleType( m_Command.m_AudioFormat ).m_Flags;
  m_Record.m_Samples = 0;
  // One by one: the record is packed, and no reference may be taken to a word of it.
  for( size_t Word = 0; Word < sizeof( m_Record.m_Timecodes ) / sizeof( uint64_t ); ++Word )
  {
    m_Record.m_Timecodes[Word] = NoTimecodeWord;
  }
}

// A frame whose ancillary data cannot be had carries neither sound nor timecode. One with fewer samples than the mode has carries those.
void VBluefish444Device::VImpl::Decode( uint32_t i_Buffer, VVideoInputDataSourceFrame& io_rFrame )
{
  io_rFrame.m_AudioBytes = 0;
  io_rFrame.m_AudioCapacity = 0;
  PrepareRecord( io_rFrame.Audio() );
  if( !m_pCard->ReadBuffer( m_pHanc, BlueVelvet::HancBytes, i_Buffer | Buffer::ImageHanc | Buffer::DataHanc ) ||
    !m_pCard->DecodeHanc( m_CardType, m_pHanc, m_Record ) )
  {
    return;
  }
  io_rFrame.m_Timecode = ReadTimecode( m_Record, m_Command.m_TimecodeSource, m_Setup.m_pStandard->m_Period );
  const uint32_t Channels = std::min( m_Command.m_AudioChannels, MostAudioChannels );
  const uint32_t SampleBytes = ToSampleType( m_Command.m_AudioFormat ).m_Bytes;
  const uint32_t Samples = Channels == 0 ? 0 : std::min( m_Record.m_Samples / Channels, m_Record.m_MostSamples );
  if( Samples > 0 )
  {
    io_rFrame.m_AudioInfo = { m_Command.m_AudioFormat, AudioSampleRate, Channels };
    io_rFrame.m_AudioBytes = Samples * Channels * SampleBytes;
    io_rFrame.m_AudioCapacity = io_rFrame.m_AudioBytes;
  }
}

void VBluefish444Device::VImpl::ResolveRepeats( KVZ::ITimecode& io_rTimecode )
{
  const KVZ::ITimecode Read = io_rTimecode;
  const int64_t Period = m_Setup.m_pStandard->m_Period;
  bool bOtherStandard = false;
  uint32_t Repeats = 0;
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    bOtherStandard = FollowTimecode( io_rTimecode, Period );
    Repeats = m_Repeats;
  }
  KVZ_LOG( Bluefish444LogCategory, 6, "Timecode=%1%, SubFrameCount=%2%, FramePeriod=%3%", KVZ::ToText( Read ), Repeats, Period );
  if( bOtherStandard )
  {
    m_TimecodeChanged();
  }
}

}
