// Frames of a test: their descriptions, and bytes that are alike in every run.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"

#include <memory>
#include <random>
#include <string>
#include <vector>

namespace TestSupport
{

using VBytes = std::vector<uint8_t>;

inline VBytes Bytes( const std::string& i_rText ) { return { i_rText.begin(), i_rText.end() }; }

inline void Append( VBytes& o_rBytes, const VBytes& i_rMore ) { o_rBytes.insert( o_rBytes.end(), i_rMore.begin(), i_rMore.end() ); }

// The same bytes for the same number.
inline VBytes Noise( size_t i_Size, uint32_t i_Number )
{
  std::mt19937 Random( i_Number );
  VBytes Result( i_Size );
  for( uint8_t& rByte : Result )
  {
    rByte = static_cast<uint8_t>( Random() );
  }
  return Result;
}

inline std::shared_ptr<const KVZ::IBufferConst> Buffer( VBytes i_Bytes )
{
  auto pBuffer = std::make_shared<KVZ::IStandardBuffer>();
  pBuffer->Bytes() = std::move( i_Bytes );
  return pBuffer;
}

// Of all buffers, one after another.
inline VBytes BytesOf( const KVZ::VBufferList& i_rBuffers )
{
  VBytes Result;
  for( const auto& rpBuffer : i_rBuffers )
  {
    Result.insert( Result.end(), rpBuffer->Data(), rpBuffer->Data() + rpBuffer->Size() );
  }
  return Result;
}

inline KVZ::VideoFrameInfo VideoInfo( KVZ::IPixelFormat::Enum i_Format = KVZ::IPixelFormat::ELuminance8, uint32_t i_Width = 4, uint32_t i_Height = 1 )
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = i_Width;
  Info.m_ImageHeight = i_Height;
  Info.m_PixelFormat = i_Format;
  Info.m_PixelAspectRatio = 1.0;
  Info.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  return Info;
}

constexpr KVZ::AudioFrameInfo MonoAudio{ KVZ::IAudioSampleFormat::EInt16, 48000, 1 };
constexpr KVZ::VTimingRecord Rate25{ 135000000, 5400000, 0 };
constexpr KVZ::VTimingRecord Rate2997{ 135000000, 4504500, 0 };

}
