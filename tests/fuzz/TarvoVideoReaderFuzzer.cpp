// Any bytes as a tvid file: what the reader gives lies in it, and its counts agree.
#include "FileIO/TarvoVideo/Reader.h"
#include "Utils/UtilsIO/StreamAdapters.h"
#include "tests/fuzz/Fuzzing.h"

using Fuzzing::Require;
using TarvoVideo::VExtent;

namespace
{

void RequireInside( const VExtent& i_rExtent, uint64_t i_Size )
{
  Require( i_rExtent.m_Position <= i_Size && i_rExtent.m_Size <= i_Size - i_rExtent.m_Position, "a frame lies in the file" );
}

uint64_t ReadBytes( TarvoVideo::VReader& io_rReader, const VExtent& i_rExtent )
{
  uint64_t Bytes = 0;
  Require( io_rReader.Read( i_rExtent, [&Bytes]( const uint8_t*, size_t i_Size ) { Bytes += i_Size; } ), "a frame's bytes can be read" );
  return Bytes;
}

// The frames that Next gives.
uint64_t Walk( TarvoVideo::VReader& io_rReader, uint64_t i_Size )
{
  uint64_t Frames = 0;
  uint64_t LastKey = 0;
  for( TarvoVideo::VFrameRecord Record; io_rReader.Next( Record ); ++Frames )
  {
    RequireInside( Record.m_Video, i_Size );
    RequireInside( Record.m_Audio, i_Size );
    Require( Frames == 0 || Record.m_Key > LastKey, "keys ascend" );
    Require( ReadBytes( io_rReader, Record.m_Video ) == Record.m_Video.m_Size, "a frame's bytes are whole" );
    LastKey = Record.m_Key;
  }
  return Frames;
}

}

extern "C" int LLVMFuzzerTestOneInput( const uint8_t* i_pData, size_t i_Size )
{
  const std::vector<uint8_t> File( i_pData, i_pData + i_Size );
  TarvoVideo::VReader Reader;
  if( !Reader.Open( std::make_unique<KVZ::ISimpleInputStreamAdapter>( File ), File.size() ) )
  {
    Require( !Reader.GetError().empty(), "a refusal says why" );
    return 0;
  }
  uint64_t Counted = 0;
  const bool bCounted = Reader.CountFrames( Counted );
  const uint64_t Walked = Walk( Reader, File.size() );
  if( Reader.GetError().empty() )
  {
    Require( bCounted && Counted == Walked, "counting and walking find the same frames" );
    Require( Reader.GetTrailingBytes() <= File.size(), "what is left over lies in the file" );
    Reader.Rewind();
    Require( Walk( Reader, File.size() ) == Walked, "a second walk finds them again" );
  }
  return 0;
}
