#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputFileRecord.h"

#include "Core/VideoInterface/EnumTable.h"
#include "Core/VideoInterface/VideoAttributes.h"
#include "FileIO/AudioEncoding/AudioEncoding.h"
#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <algorithm>
#include <exception>
#include <utility>

namespace VideoInputHAL
{

using StageCorePluginInterface::VCaptureTarget;

namespace
{

std::string MakePath( const VCaptureTarget& i_rTarget )
{
  std::string Name = i_rTarget.m_BaseName + "_" + i_rTarget.m_DeviceLabel;
  if( i_rTarget.m_Container == KVZ::IVideoContainer::EIMAGES )
  {
    Name += "_%FRAME%";
  }
  else if( !i_rTarget.m_Extension.empty() )
  {
    Name += "." + i_rTarget.m_Extension;
  }
  return ( boost::filesystem::path( i_rTarget.m_Folder ) / Name ).string();
}

KVZ::IVideoContainer::Enum ContainerOf( const VCaptureTarget& i_rTarget ) { return static_cast<KVZ::IVideoContainer::Enum>( i_rTarget.m_Container ); }

KVZ::IVideoPayload::Enum VideoPayloadOf( const VCaptureTarget& i_rTarget )
{
  return static_cast<KVZ::IVideoPayload::Enum>( i_rTarget.m_VideoPayload );
}

KVZ::IAudioPayload::Enum AudioPayloadOf( const VCaptureTarget& i_rTarget )
{
  return static_cast<KVZ::IAudioPayload::Enum>( i_rTarget.m_AudioPayload );
}

bool HasVideo( const VVideoInputDataSourceFrame* i_pFrame )
{
  if( !i_pFrame )
  {
    KVZ_LOG_ERROR( "VideoInputDataSource", "No video data." );
    return false;
  }
  if( i_pFrame->m_ImageBytes == 0 )
  {
    KVZ_LOG_ERROR( "VideoInputDatasource", "No video data." );
    return false;
  }
  return true;
}

bool IsSameImage( const KVZ::VideoFrameInfo& i_rA, const KVZ::VideoFrameInfo& i_rB )
{
  return i_rA.m_ImageWidth == i_rB.m_ImageWidth && i_rA.m_ImageHeight == i_rB.m_ImageHeight && i_rA.m_PixelFormat == i_rB.m_PixelFormat;
}

// "1920 x 1080 U8Y8V8Y8, 16 channels of Int16 at 48000 Hz"
std::string FormatText( const KVZ::VideoFrameInfo& i_rVideo, const KVZ::AudioFrameInfo& i_rAudio )
{
  std::string Text = std::to_string( i_rVideo.m_ImageWidth ) + " x " + std::to_string( i_rVideo.m_ImageHeight ) + " " +
    KVZ::NameOrUnspecified( i_rVideo.m_PixelFormat );
  if( !i_rAudio.HasAudio() )
  {
    return Text + " without audio";
  }
  return Text + ", " + std::to_string( i_rAudio.m_Channels ) + " channels of " + KVZ::NameOrUnspecified( i_rAudio.m_SampleFormat ) + " at " +
    std::to_string( i_rAudio.m_SampleRate ) + " Hz";
}

KVZ::VConversionRecord RecordingStep( const VCaptureTarget& i_rTarget, KVZ::IPixelFormat::Enum i_Captured )
{
  KVZ::IPixelFormat::Enum Stored = i_Captured;
  VideoEncoding::PixelFormatForPayloadFormat( VideoPayloadOf( i_rTarget ), i_Captured, Stored );
  KVZ::VConversionRecord Record;
  Record.m_Container = KVZ::NameOrUnspecified( ContainerOf( i_rTarget ) );
  Record.m_AudioPayload = KVZ::NameOrUnspecified( AudioPayloadOf( i_rTarget ) );
  Record.m_VideoPayload = KVZ::NameOrUnspecified( VideoPayloadOf( i_rTarget ) );
  Record.m_PixelFormat = KVZ::NameOrUnspecified( Stored );
  return Record;
}

}

VVideoInputBufferClient::VFileRecord::VFileRecord( const VCaptureTarget& i_rTarget, const VVideoEncoderSettings& i_rSettings,
  std::shared_ptr<KVZ::IVideoWriter> i_pWriter )
  : m_Target( i_rTarget ),
    m_pWriter( std::move( i_pWriter ) ),
    m_pAudioAllocator( std::make_shared<KVZ::IStandardBufferAllocator>( "Capture audio" ) ),
    m_pConversion( std::make_unique<VFrameConversion>( i_rTarget, i_rSettings ) )
{
  m_Report.m_Path = MakePath( m_Target );
  m_Report.m_Container = m_Target.m_Container;
}

VVideoInputBufferClient::VFileRecord::~VFileRecord() = default;

bool VVideoInputBufferClient::VFileRecord::Create()
{
  boost::system::error_code Error;
  boost::filesystem::create_directories( m_Target.m_Folder, Error );
  if( Error )
  {
    KVZ_LOG_ERROR( "VideoInputDataSource", "The folder \"%1%\" could not be made: %2%", m_Target.m_Folder, Error.message() );
  }
  m_bCreated = !Error && m_pWriter && m_pWriter->Open( m_Report.m_Path );
  return m_bCreated || Fail( "Could not create capture file: \"" + m_Report.m_Path + "\"" );
}

bool VVideoInputBufferClient::VFileRecord::Prepare( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice,
  uint64_t& o_rKey )
{
  o_rKey = m_NextKey++;
  if( !HasVideo( i_rFrame.m_pFrame ) )
  {
    return Fail( WriteFailureText() );
  }
  return m_bHeaderWritten ? HasHeaderFormat( *i_rFrame.m_pFrame ) : WriteHeader( i_rFrame, i_rSettings, i_rDevice );
}

VFrameOutcome VVideoInputBufferClient::VFileRecord::WriteFrame( const VFrameView& i_rFrame, uint64_t i_Key ) const noexcept
try
{
  return TryWriteFrame( i_rFrame, i_Key );
}
catch( const std::exception& i_rException )
{
  return { i_Key, false, 0, std::string( "A frame could not be prepared for its files: " ) + i_rException.what() };
}

VFrameOutcome VVideoInputBufferClient::VFileRecord::TryWriteFrame( const VFrameView& i_rFrame, uint64_t i_Key ) const
{
  VFrameOutcome Outcome{ i_Key };
  // The frame's own description, but for what the file does not keep as it was captured.
  KVZ::VideoFrameInfo Info = i_rFrame.m_pFrame->m_VideoInfo;
  KVZ::VBufferList Video( 1, i_rFrame.m_pVideo );
  KVZ::VBufferList Audio;
  if( m_Kept.HasAudio() && i_rFrame.m_pAudio )
  {
    Audio.push_back( i_rFrame.m_pAudio );
  }
  Outcome.m_bWritten = m_pConversion->Apply( i_rFrame.m_pFrame->m_Timecode, Video, Info ) && KeepChannels( Audio ) &&
    m_pWriter->WriteFrame( Video, Info, Audio, m_Kept, i_Key );
  Outcome.m_Bytes = Outcome.m_bWritten ? KVZ::GetTotalSize( Video ) : 0;
  return Outcome;
}

// Frames of a parallel file come in any order: of several that have failed the first one of the file is told.
bool VVideoInputBufferClient::VFileRecord::Count( const VFrameOutcome& i_rOutcome )
{
  if( i_rOutcome.m_bWritten )
  {
    ++m_Report.m_FramesWritten;
    m_PayloadBytes += i_rOutcome.m_Bytes;
    return !m_Report.m_bFailed;
  }
  m_FailedKey = std::min( m_FailedKey, i_rOutcome.m_Key );
  if( !m_Report.m_bFailed )
  {
    i_rOutcome.m_Error.empty() ? FailWriter() : Fail( i_rOutcome.m_Error );
  }
  return false;
}

bool VVideoInputBufferClient::VFileRecord::WriteHeader( const VFrameView& i_rFrame, const VSettings& i_rSettings, const VDeviceRecord& i_rDevice )
{
  const VVideoInputDataSourceFrame& rFrame = *i_rFrame.m_pFrame;
  m_Video = rFrame.m_VideoInfo;
  m_Captured = rFrame.m_AudioInfo;
  m_Kept = KeptAudio( m_Captured );
  m_Report.m_StartTimecode = rFrame.m_Timecode;
  m_Report.m_StartTick = i_rFrame.m_Tick;
  m_Report.m_Period = i_rFrame.m_Period;
  KVZ::VTimingRecord Timing;
  Timing.m_FramePeriodInTicks = static_cast<uint32_t>( i_rFrame.m_Period.Count() );
  Timing.m_StartOffsetInTicks = i_rFrame.m_Tick.Count();
  KVZ::VideoFrameInfo Written = m_Video;
  Written.m_PixelFormat = m_pConversion->FormatFor( m_Video.m_PixelFormat );
  m_bHeaderWritten = m_pWriter->WriteHeader( Written, m_Kept, Timing, rFrame.m_Timecode, KVZ::VColourRecord(),
    MakeAttributes( i_rFrame, i_rSettings, i_rDevice ), VideoPayloadOf( m_Target ),
    m_Kept.HasAudio() ? AudioPayloadOf( m_Target ) : KVZ::IAudioPayload::ENone );
  if( m_bHeaderWritten )
  {
    return true;
  }
  KVZ_LOG_ERROR( "VideoInputDataSource", "Failed writing video file header information." );
  return FailWriter();
}

KVZ::IVideoAttributes VVideoInputBufferClient::VFileRecord::MakeAttributes( const VFrameView& i_rFrame, const VSettings& i_rSettings,
  const VDeviceRecord& i_rDevice ) const
{
  KVZ::IVideoAttributes Attributes;
  KVZ::VCameraHardwareRecord Camera;
  Camera.m_DeviceURN = i_rDevice.m_URN;
  Camera.m_Type = i_rDevice.m_DriverName;
  Camera.m_DisplayType = i_rDevice.m_DeviceName;
  Camera.m_SensorWidthInPixels = m_Video.m_ImageWidth;
  Camera.m_SensorHeightInPixels = m_Video.m_ImageHeight;
  Camera.m_PixelAspectRatio = m_Video.m_PixelAspectRatio;
  Camera.WriteAttributes( Attributes );
  KVZ::WriteAttributes( { RecordingStep( m_Target, m_pConversion->FormatFor( m_Video.m_PixelFormat ) ) }, Attributes );
  Attributes.Set( "Capture.Name", i_rSettings.m_Header.m_Name );
  Attributes.Set( "Capture.Id", i_rSettings.m_Header.m_CaptureSessionId.Value() );
  Attributes.Set( "Capture.GlobalSyncSessionId", i_rSettings.m_Header.m_GlobalSyncSessionId.Value() );
  Attributes.Set( "Capture.StartTick", i_rFrame.m_Tick.Count() );
  Attributes.Set( "Capture.Manufacturer", i_rDevice.m_ManufacturerName );
  Attributes.Set( "Capture.DeviceLabel", m_Target.m_DeviceLabel );
  Attributes.Set( "Capture.CapturedChannels", m_Captured.m_Channels );
  return Attributes;
}

KVZ::AudioFrameInfo VVideoInputBufferClient::VFileRecord::KeptAudio( const KVZ::AudioFrameInfo& i_rCaptured ) const
{
  KVZ::AudioFrameInfo Kept = i_rCaptured;
  Kept.m_Channels = std::min( i_rCaptured.m_Channels, m_Target.m_AudioChannels );
  return Kept.HasAudio() && AudioPayloadOf( m_Target ) != KVZ::IAudioPayload::ENone ? Kept : KVZ::AudioFrameInfo();
}

// A frame of another format would make a file that is wrong without saying so.
bool VVideoInputBufferClient::VFileRecord::HasHeaderFormat( const VVideoInputDataSourceFrame& i_rFrame )
{
  const bool bSameAudio = i_rFrame.m_AudioInfo == m_Captured;
  if( IsSameImage( i_rFrame.m_VideoInfo, m_Video ) && bSameAudio )
  {
    return true;
  }
  return Fail( WriteFailureText() + ": the format of the frames changed from " + FormatText( m_Video, m_Captured ) + " to " +
    FormatText( i_rFrame.m_VideoInfo, i_rFrame.m_AudioInfo ) );
}

// The first channels of every sample.
bool VVideoInputBufferClient::VFileRecord::KeepChannels( KVZ::VBufferList& io_rAudio ) const
{
  return io_rAudio.empty() || m_Kept.m_Channels == m_Captured.m_Channels ||
    AudioEncoding::EncodeIfRequired( *m_pAudioAllocator, io_rAudio, m_Captured, KVZ::IAudioPayload::EUncompressed, m_Captured.m_SampleFormat,
      m_Kept.m_Channels );
}

void VVideoInputBufferClient::VFileRecord::Close()
{
  if( !m_bCreated )
  {
    return;
  }
  const bool bClosed = !m_pWriter->IsOpen() || m_pWriter->Close();
  // Frames behind one that has failed are no part of an unbroken sequence.
  m_Report.m_FramesWritten = std::min( m_Report.m_FramesWritten, m_FailedKey ) - m_pWriter->CountIncompleteFrames();
  if( !bClosed && m_bHeaderWritten && !m_Report.m_bFailed )
  {
    FailWriter();
  }
  m_Report.m_Bytes = CountBytes();
}

// As they lie on the disk, where they do.
uint64_t VVideoInputBufferClient::VFileRecord::CountBytes() const
{
  boost::system::error_code Error;
  if( m_Target.m_Container == KVZ::IVideoContainer::EIMAGES )
  {
    uint64_t Sum = 0;
    for( boost::filesystem::directory_iterator File( m_Target.m_Folder, Error ), End; !Error && File != End; File.increment( Error ) )
    {
      boost::system::error_code Gone;
      Sum += boost::filesystem::is_regular_file( File->path(), Gone ) ? boost::filesystem::file_size( File->path(), Gone ) : 0;
    }
    return Sum;
  }
  const uint64_t Size = boost::filesystem::is_regular_file( m_Report.m_Path, Error ) ? boost::filesystem::file_size( m_Report.m_Path, Error ) : 0;
  return Size != 0 && !Error ? Size : m_PayloadBytes;
}

bool VVideoInputBufferClient::VFileRecord::FailWriter()
{
  KVZ_LOG_ERROR( "VideoInputDataSource", "Error writing capture file with container format '%s'.",
    KVZ::NameOrUnspecified( ContainerOf( m_Target ) ) );
  return Fail( WriteFailureText() );
}

std::string VVideoInputBufferClient::VFileRecord::WriteFailureText() const
{
  return "Failed attempting to write data to file \"" + m_Report.m_Path + "\"";
}

bool VVideoInputBufferClient::VFileRecord::Fail( std::string i_Error )
{
  m_Report.m_bFailed = true;
  m_Report.m_Error = std::move( i_Error );
  return false;
}

}
