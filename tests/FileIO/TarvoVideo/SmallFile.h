// A recording of a few bytes, written into memory: 4 x 1 grey pixels and one channel of 16-bit sound.
#pragma once

#include "FileIO/TarvoVideo/Reader.h"
#include "FileIO/TarvoVideo/Writer.h"
#include "tests/support/FailingStream.h"
#include "tests/support/MemoryFile.h"

#include <cstring>
#include <map>
#include <memory>
#include <vector>

namespace TarvoVideo
{

using VBytes = std::vector<uint8_t>;

// Bytes put together piece by piece, numbers little-endian.
class VBuilder
{
public:
  VBuilder& Raw( const std::string& i_rText )
  {
    m_Bytes.insert( m_Bytes.end(), i_rText.begin(), i_rText.end() );
    return *this;
  }
  template<class T>
  VBuilder& Number( T i_Value )
  {
    const auto* pBytes = reinterpret_cast<const uint8_t*>( &i_Value );
    m_Bytes.insert( m_Bytes.end(), pBytes, pBytes + sizeof( T ) );
    return *this;
  }
  VBuilder& U32( uint32_t i_Value ) { return Number( i_Value ); }
  VBuilder& U64( uint64_t i_Value ) { return Number( i_Value ); }
  VBuilder& Text( const std::string& i_rText ) { return U32( static_cast<uint32_t>( i_rText.size() ) ).Raw( i_rText ); }

  VBytes m_Bytes;
};

inline std::shared_ptr<const KVZ::IBufferConst> Buffer( const VBytes& i_rBytes )
{
  auto pBuffer = std::make_shared<KVZ::IStandardBuffer>();
  pBuffer->Bytes() = i_rBytes;
  return pBuffer;
}

inline KVZ::VideoFrameInfo SmallVideo()
{
  KVZ::VideoFrameInfo Info;
  Info.m_ImageWidth = 4;
  Info.m_ImageHeight = 1;
  Info.m_PixelFormat = KVZ::IPixelFormat::ELuminance8;
  Info.m_PixelAspectRatio = 1.0;
  Info.m_InterlacedFormat = KVZ::IInterlacedFormat::ENotInterlaced;
  return Info;
}

constexpr KVZ::AudioFrameInfo SmallAudio{ KVZ::IAudioSampleFormat::EInt16, 48000, 1 };

struct VFrameContent
{
  VBytes m_Video;
  VBytes m_Audio;
  bool operator==( const VFrameContent& ) const = default;
};
using VContents = std::map<uint64_t, VFrameContent>;

// A writer into memory. The results of its operations are kept.
struct VSmallFile
{
  explicit VSmallFile( const TestSupport::VFault& i_rFault = {} )
    : m_Writer( {},
        [this, i_rFault]( const std::string& )
        {
          m_pBytes->clear();
          return std::make_unique<TestSupport::VFailingStream>( std::make_unique<TestSupport::VMemoryFile>( m_pBytes ), i_rFault, &m_Operations );
        } )
  {
  }

  bool OpenAndWriteHeader( const KVZ::VideoFrameInfo& i_rVideo = SmallVideo(), const KVZ::AudioFrameInfo& i_rAudio = SmallAudio )
  {
    KVZ::IVideoAttributes External;
    External.Set( "Take", "one" );
    const auto AudioPayload = i_rAudio.IsEmpty() ? KVZ::IAudioPayload::ENone : KVZ::IAudioPayload::EUncompressed;
    return m_Writer.Open( "memory" ) &&
      m_Writer.WriteHeader( i_rVideo, i_rAudio, {}, {}, {}, External, KVZ::IVideoPayload::EUncompressed, AudioPayload );
  }

  bool WriteFrame( uint64_t i_Key, const VFrameContent& i_rContent, const KVZ::VideoFrameInfo& i_rVideo = SmallVideo() )
  {
    return m_Writer.WriteFrame( KVZ::VFrameSet{ Buffer( i_rContent.m_Video ), i_rVideo, { Buffer( i_rContent.m_Audio ) }, SmallAudio }, i_Key );
  }

  std::shared_ptr<VBytes> m_pBytes = std::make_shared<VBytes>();
  uint64_t m_Operations = 0;
  VWriter m_Writer;
};

// What a reader finds. The error is empty for a file that it reads to the end.
struct VFound
{
  bool m_bFinished = false;
  VContents m_Frames;
  std::string m_Error;
};

inline VFound ReadAll( const VBytes& i_rBytes )
{
  VFound Found;
  VReader Reader;
  if( Reader.Open( std::make_unique<KVZ::ISimpleInputStreamAdapter>( i_rBytes ), i_rBytes.size() ) )
  {
    Found.m_bFinished = Reader.IsFinished();
    VFrameRecord Record;
    while( Reader.Next( Record ) )
    {
      VFrameContent& rContent = Found.m_Frames[Record.m_Key];
      const auto AppendTo = []( VBytes& o_rTarget )
      { return [&o_rTarget]( const uint8_t* i_pData, size_t i_Size ) { o_rTarget.insert( o_rTarget.end(), i_pData, i_pData + i_Size ); }; };
      if( !Reader.Read( Record.m_Video, AppendTo( rContent.m_Video ) ) || !Reader.Read( Record.m_Audio, AppendTo( rContent.m_Audio ) ) )
      {
        break;
      }
    }
  }
  Found.m_Error = Reader.GetError();
  return Found;
}

}
