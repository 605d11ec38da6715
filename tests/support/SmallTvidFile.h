// A recording of a few bytes, written into memory: 4 x 1 grey pixels and one channel of 16-bit sound.
#pragma once

#include "FileIO/TarvoVideo/Reader.h"
#include "FileIO/TarvoVideo/Writer.h"
#include "tests/support/ByteBuilder.h"
#include "tests/support/SmallRecording.h"

#include <map>

namespace TarvoVideo
{

using TestSupport::VBytes;

struct VFrameContent
{
  VBytes m_Video;
  VBytes m_Audio;
  bool operator==( const VFrameContent& ) const = default;
};
using VContents = std::map<uint64_t, VFrameContent>;

// Without timing; with an attribute.
struct VSmallHeader : TestSupport::VHeader
{
  VSmallHeader()
  {
    m_Video = TestSupport::VideoInfo();
    m_Timing = {};
    m_Attributes.Set( "Take", "one" );
  }
};

struct VSmallFile : TestSupport::VMemoryRecording<VWriter>
{
  explicit VSmallFile( const TestSupport::VFault& i_rFault = {} )
    : VMemoryRecording( VSmallHeader(), i_rFault, []( WriterSupport::VStreamMaker i_Maker ) { return VWriter( {}, std::move( i_Maker ) ); } )
  {
  }

  bool WriteFrame( uint64_t i_Key, const VFrameContent& i_rContent ) { return Frame( i_rContent.m_Video, i_rContent.m_Audio, i_Key ); }
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
