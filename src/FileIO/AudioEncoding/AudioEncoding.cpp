#include "FileIO/AudioEncoding/AudioEncoding.h"

#include "CoreAudioUtils/AudioSampleFormatConverter.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <cstring>

namespace AudioEncoding
{

namespace
{

using VConstBuffer = std::shared_ptr<const KVZ::IBufferConst>;

// The first i_Channels of each sample frame. Nothing where memory has run out.
VConstBuffer DropChannels( KVZ::IBufferAllocator& i_rAllocator, const KVZ::IBufferConst& i_rSource, const KVZ::AudioFrameInfo& i_rInfo,
  uint32_t i_Channels )
{
  const size_t SampleBytes = KVZ::GetBytesPerSample( i_rInfo.m_SampleFormat );
  const size_t SourceStride = SampleBytes * i_rInfo.m_Channels;
  const size_t TargetStride = SampleBytes * i_Channels;
  const size_t Frames = SourceStride == 0 ? 0 : i_rSource.Size() / SourceStride;

  const std::shared_ptr<KVZ::IBuffer> pTarget = i_rAllocator.Allocate( Frames * TargetStride );
  if( !pTarget )
  {
    return nullptr;
  }
  const uint8_t* pSource = i_rSource.Data();
  uint8_t* pStored = pTarget->Data();
  if( TargetStride != 0 )
  {
    for( size_t Frame = 0; Frame < Frames; ++Frame )
    {
      std::memcpy( pStored + Frame * TargetStride, pSource + Frame * SourceStride, TargetStride );
    }
  }
  return pTarget;
}

bool ConvertBuffers( KVZ::IBufferAllocator& i_rAllocator, KVZ::VBufferList& io_rAudio, const KVZ::AudioFrameInfo& i_rInfo,
  KVZ::IAudioSampleFormat::Enum i_Stored )
{
  for( VConstBuffer& rpBuffer : io_rAudio )
  {
    const size_t Size = CoreAudioUtils::GetConvertedSize( i_rInfo.m_SampleFormat, i_Stored, rpBuffer->Size() );
    const std::shared_ptr<KVZ::IBuffer> pTarget = i_rAllocator.Allocate( Size );
    if( !pTarget || !CoreAudioUtils::ConvertSamples( i_rInfo, i_Stored, rpBuffer->Data(), rpBuffer->Size(), pTarget->Data() ) )
    {
      return false;
    }
    rpBuffer = pTarget;
  }
  return true;
}

}

void SampleFormatForPayloadFormat( KVZ::IAudioPayload::Enum i_Payload, KVZ::IAudioSampleFormat::Enum i_Source,
  KVZ::IAudioSampleFormat::Enum& io_rStored, bool& o_rConversionNeeded )
{
  switch( i_Payload )
  {
    case KVZ::IAudioPayload::ENone: io_rStored = KVZ::IAudioSampleFormat::EUnspecified; break;
    case KVZ::IAudioPayload::EUncompressed: io_rStored = i_Source; break;
    default: KVZ_LOG_ERROR( "AudioEncoding", "Unsupported audio format." ); break;
  }
  o_rConversionNeeded = io_rStored != i_Source;
}

bool EncodeIfRequired( KVZ::IBufferAllocator& i_rAllocator, KVZ::VBufferList& io_rAudio, const KVZ::AudioFrameInfo& i_rInfo,
  KVZ::IAudioPayload::Enum i_Payload, KVZ::IAudioSampleFormat::Enum i_StoredFormat, uint32_t i_StoredChannels )
{
  if( i_Payload == KVZ::IAudioPayload::ENone || !i_rInfo.HasAudio() )
  {
    io_rAudio.clear();
    return true;
  }
  if( i_StoredChannels > i_rInfo.m_Channels )
  {
    KVZ_LOG_ERROR( "AudioEncoding", "Increasing number of audio channels is not supported." );
    return false;
  }
  KVZ::AudioFrameInfo Info = i_rInfo;
  if( i_StoredChannels < Info.m_Channels )
  {
    for( VConstBuffer& rpBuffer : io_rAudio )
    {
      VConstBuffer pStored = DropChannels( i_rAllocator, *rpBuffer, i_rInfo, i_StoredChannels );
      if( !pStored )
      {
        return false;
      }
      rpBuffer = std::move( pStored );
    }
    Info.m_Channels = i_StoredChannels;
  }
  if( i_Payload != KVZ::IAudioPayload::EUncompressed )
  {
    KVZ_LOG_ERROR( "AudioEncoding", "Unsupported audio format" );
    return false;
  }
  return i_StoredFormat == Info.m_SampleFormat || ConvertBuffers( i_rAllocator, io_rAudio, Info, i_StoredFormat );
}

}
