#include "FileIO/AudioEncoding/AudioEncoding.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"
#include "tests/support/EndlessBuffer.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <cstring>

using namespace KVZ;

namespace
{

constexpr AudioFrameInfo FourChannels{ IAudioSampleFormat::EInt16, 48000, 4 };

std::shared_ptr<IStandardBuffer> Samples( const std::vector<int16_t>& i_rSamples )
{
  auto pBuffer = std::make_shared<IStandardBuffer>( i_rSamples.size() * 2 );
  std::copy_n( reinterpret_cast<const uint8_t*>( i_rSamples.data() ), pBuffer->Size(), pBuffer->Data() );
  return pBuffer;
}

template<class T>
std::vector<T> SamplesOf( const IBufferConst& i_rBuffer )
{
  std::vector<T> Samples( i_rBuffer.Size() / sizeof( T ) );
  std::memcpy( Samples.data(), i_rBuffer.Data(), i_rBuffer.Size() );
  return Samples;
}

class AudioEncoder : public testing::Test
{
protected:
  bool Encode( uint32_t i_Channels, IAudioSampleFormat::Enum i_Format = IAudioSampleFormat::EInt16,
    IAudioPayload::Enum i_Payload = IAudioPayload::EUncompressed, const AudioFrameInfo& i_rInfo = FourChannels )
  {
    return AudioEncoding::EncodeIfRequired( m_Allocator, m_Audio, i_rInfo, i_Payload, i_Format, i_Channels );
  }

  KVZ::IStandardBufferAllocator m_Allocator{ "Test" };
  VBufferList m_Audio{ Samples( { 1, 2, 3, 4, 5, 6, 7, 8 } ), Samples( {} ), Samples( { 9, 10, 11, 12 } ) };
  const VBufferList m_Before = m_Audio;
  const TestSupport::VLogCapture m_Log{ "AudioEncoding" };
};

}

TEST_F( AudioEncoder, SurplusChannelsAreDroppedFromTheEndAndTheRestIsConverted )
{
  EXPECT_TRUE( Encode( 4 ) );
  EXPECT_EQ( m_Audio, m_Before ) << "what fits passes without a copy";
  EXPECT_TRUE( Encode( 2 ) );
  ASSERT_EQ( m_Audio.size(), 3u );
  EXPECT_EQ( SamplesOf<int16_t>( *m_Audio[0] ), ( std::vector<int16_t>{ 1, 2, 5, 6 } ) );
  EXPECT_EQ( m_Audio[1]->Size(), 0u );
  EXPECT_EQ( SamplesOf<int16_t>( *m_Audio[2] ), ( std::vector<int16_t>{ 9, 10 } ) );
  m_Audio = m_Before;
  EXPECT_TRUE( Encode( 3, IAudioSampleFormat::EInt32 ) );
  EXPECT_EQ( SamplesOf<int32_t>( *m_Audio[2] ), ( std::vector<int32_t>{ 9 << 16, 10 << 16, 11 << 16 } ) );
}

TEST_F( AudioEncoder, SoundForWhichThereIsNoMemoryIsRefused )
{
  m_Audio = { std::make_shared<TestSupport::VEndlessBuffer>( ~size_t{ 0 } ) };
  const VBufferList Before = m_Audio;
  EXPECT_FALSE( Encode( 3 ) );
  EXPECT_FALSE( Encode( 4, IAudioSampleFormat::EUInt16 ) );
  EXPECT_EQ( m_Audio, Before );
}

TEST_F( AudioEncoder, WithoutAPayloadOrAFullDescriptionThereIsNoAudio )
{
  for( const AudioFrameInfo& rInfo :
    { AudioFrameInfo{ IAudioSampleFormat::EInt16, 0, 4 }, { IAudioSampleFormat::EInt16, 48000, 0 }, { IAudioSampleFormat::EUnspecified, 48000, 4 } } )
  {
    m_Audio = m_Before;
    EXPECT_TRUE( Encode( 8, IAudioSampleFormat::EInt16, IAudioPayload::EUncompressed, rInfo ) );
    EXPECT_TRUE( m_Audio.empty() );
  }
  m_Audio = m_Before;
  EXPECT_TRUE( Encode( 0, IAudioSampleFormat::EUnspecified, IAudioPayload::ENone ) );
  EXPECT_TRUE( m_Audio.empty() );
}

TEST_F( AudioEncoder, RefusalsSayWhyAndLeaveTheList )
{
  EXPECT_FALSE( Encode( 5, IAudioSampleFormat::EInt32 ) );
  EXPECT_FALSE( Encode( 4, IAudioSampleFormat::EInt16, IAudioPayload::ELosslessFLAC ) );
  EXPECT_FALSE( Encode( 4, IAudioSampleFormat::EUInt16 ) );
  EXPECT_EQ( m_Audio, m_Before );
  auto Stored = IAudioSampleFormat::EInt24;
  bool bConversionNeeded = false;
  AudioEncoding::SampleFormatForPayloadFormat( IAudioPayload::ELosslessFLAC, IAudioSampleFormat::EInt16, Stored, bConversionNeeded );
  EXPECT_EQ( Stored, IAudioSampleFormat::EInt24 );
  EXPECT_TRUE( bConversionNeeded );
  EXPECT_EQ( m_Log.Texts(),
    ( std::vector<std::string>{ "Increasing number of audio channels is not supported.", "Unsupported audio format",
      "Unsupported audio format." } ) );
}
