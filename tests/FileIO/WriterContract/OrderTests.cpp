// The calling order, the checks of a header, and what the tables of capabilities promise.
#include "tests/FileIO/WriterContract/ContractWriter.h"

#include "Core/VideoInterface/EnumTable.h"

using namespace KVZ;

namespace WriterContract
{

namespace
{

constexpr int VideoPayloads = 6;
constexpr int SampleFormats = 10;

}

TEST_P( WriterContract, OperationsOutOfOrderAreRefused )
{
  VContractWriter Contract( GetParam() );
  IVideoWriter& rWriter = Contract.Writer();
  EXPECT_FALSE( rWriter.IsOpen() );
  EXPECT_FALSE( Contract.WriteFrame( 0 ) );
  EXPECT_FALSE( Contract.Header().WriteTo( rWriter ) );
  EXPECT_TRUE( m_Log.Has( "File must be opened for write access before WriteHeader is called." ) );
  EXPECT_FALSE( rWriter.Close() );

  ASSERT_TRUE( Contract.Open() );
  EXPECT_TRUE( rWriter.IsOpen() );
  EXPECT_FALSE( Contract.Open() );
  EXPECT_TRUE( m_Log.Has( "File already open." ) );
  EXPECT_TRUE( rWriter.IsOpen() );
  EXPECT_FALSE( Contract.WriteFrame( 0 ) );

  ASSERT_TRUE( Contract.Header().WriteTo( rWriter ) );
  EXPECT_FALSE( Contract.Header().WriteTo( rWriter ) );
  EXPECT_TRUE( Contract.WriteFrame( 0 ) ) << "what was refused has spoilt nothing";
  EXPECT_TRUE( rWriter.Close() );

  EXPECT_FALSE( rWriter.IsOpen() );
  EXPECT_FALSE( rWriter.Close() );
  EXPECT_FALSE( Contract.WriteFrame( 1 ) );
  EXPECT_FALSE( Contract.Header().WriteTo( rWriter ) );
}

TEST_P( WriterContract, WithoutFramesThereIsAFile )
{
  VContractWriter Contract( GetParam() );
  ASSERT_TRUE( Contract.Begin() );
  EXPECT_TRUE( Contract.Writer().Close() );
  EXPECT_FALSE( Contract.Files().begin()->second->empty() );
  EXPECT_TRUE( m_Log.Texts().empty() );
}

TEST_P( WriterContract, AFileThatCannotBeMadeIsNotOpen )
{
  const auto pWriter = GetParam().m_Make( {}, WriterSupport::MakeFile );
  EXPECT_FALSE( pWriter->Open( "/proc/no such folder/movie" ) );
  EXPECT_FALSE( pWriter->IsOpen() );
  EXPECT_EQ( m_Log.Has( "File could not be opened." ), GetParam().m_bTellsFailedOpen );
}

// Each check is failed together with all behind it, and is the only one to speak.
TEST_P( WriterContract, AHeaderIsCheckedInOrder )
{
  VContractWriter Contract( GetParam() );
  IVideoWriter& rWriter = Contract.Writer();
  const IVideoWriterCapabilities& rCapabilities = rWriter.GetCapabilities();
  ASSERT_TRUE( Contract.Open() );
  VHeader Header = Contract.Header();
  const auto IsRefused = [&]( const std::string& i_rMessage )
  {
    const size_t Lines = m_Log.Lines().size();
    EXPECT_FALSE( Header.WriteTo( rWriter ) );
    ASSERT_EQ( m_Log.Lines().size(), Lines + 1 );
    EXPECT_EQ( m_Log.Lines().back().m_Text, i_rMessage );
    EXPECT_EQ( m_Log.Lines().back().m_Level, LogLevel::Error );
  };
  // The system's own container takes all formats
  Header.m_Audio = { IAudioSampleFormat::EUInt16, 48000, 2 };
  if( GetParam().m_bAudio && !rCapabilities.IsAudioSampleFormatSupported( Header.m_Audio.m_SampleFormat ) )
  {
    IsRefused( "Audio sample format 'UInt16' is not supported for uncompressed audio." );
  }
  Header.m_AudioPayload = IAudioPayload::ELosslessFLAC;   // which none takes, as little as video that is not there
  IsRefused( "Audio payload format 'LosslessFLAC' is not supported." );
  Header.m_Video.m_PixelFormat = IPixelFormat::EBayerGB7;
  if( Header.m_Payload == IVideoPayload::EUncompressed && !rCapabilities.IsPixelFormatSupported( IPixelFormat::EBayerGB7 ) )
  {
    IsRefused( "Pixel format 'BayerGB7' is not supported for uncompressed video." );
  }
  Header.m_Payload = IVideoPayload::ENone;
  IsRefused( "Video payload format 'None' is not supported." );
  Header.m_Payload = static_cast<IVideoPayload::Enum>( 77 );
  IsRefused( "Video payload format 'Unspecified' is not supported." );

  EXPECT_TRUE( Contract.Header().WriteTo( rWriter ) ) << "what was refused has spoilt nothing";
  EXPECT_TRUE( rWriter.Close() );
}

TEST_P( WriterContract, AHeaderIsTakenOfExactlyWhatIsSupported )
{
  const auto IsTaken = [&]( const VHeader& i_rHeader )
  {
    VContractWriter Contract( GetParam() );
    return Contract.Open() && i_rHeader.WriteTo( Contract.Writer() );
  };
  VContractWriter Contract( GetParam() );
  const IVideoWriterCapabilities& rCapabilities = Contract.Writer().GetCapabilities();
  for( int Value = 0; Value < VideoPayloads; ++Value )
  {
    VHeader Header = Contract.Header();
    Header.m_Payload = static_cast<IVideoPayload::Enum>( Value );
    EXPECT_EQ( IsTaken( Header ), rCapabilities.IsVideoPayloadSupported( Header.m_Payload ) ) << ToName( Header.m_Payload );
  }
  for( int Value = 1; Value < PixelFormatCount && GetParam().m_Payload == IVideoPayload::EUncompressed; ++Value )
  {
    VHeader Header = Contract.Header();
    Header.m_Video.m_PixelFormat = static_cast<IPixelFormat::Enum>( Value );
    EXPECT_EQ( IsTaken( Header ), rCapabilities.IsPixelFormatSupported( Header.m_Video.m_PixelFormat ) ) << ToName( Header.m_Video.m_PixelFormat );
  }
  for( int Value = 1; Value < SampleFormats && GetParam().m_bAudio; ++Value )
  {
    VHeader Header = Contract.Header();
    Header.m_Audio.m_SampleFormat = static_cast<IAudioSampleFormat::Enum>( Value );
    EXPECT_EQ( IsTaken( Header ), rCapabilities.IsAudioSampleFormatSupported( Header.m_Audio.m_SampleFormat ) )
      << ToName( Header.m_Audio.m_SampleFormat );
  }
  if( GetParam().m_bAudio )
  {
    VHeader Silent = Contract.Header();
    Silent.m_Audio = {};
    Silent.m_AudioPayload = IAudioPayload::EUncompressed;
    EXPECT_TRUE( IsTaken( Silent ) ) << "a payload without any sound";
  }
}

}
