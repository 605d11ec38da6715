#include "FileIO/MovIO/MovFileCheck.h"

#include "FileIO/MovIO/TrackValidation.h"
#include "StageCoreRuntime/GlobalLog.h"
#include "Utils/UtilsIO/LargeFile.h"

#include <algorithm>
#include <array>
#include <stdexcept>
#include <string_view>

namespace MovIO
{

namespace
{

struct VAtom
{
  std::string m_Type;
  uint64_t m_Body = 0;
  uint64_t m_End = 0;
};

constexpr std::array Containers = { std::string_view( "moov" ), std::string_view( "trak" ), std::string_view( "edts" ), std::string_view( "mdia" ),
  std::string_view( "minf" ), std::string_view( "stbl" ) };

// Offsets of 32-bit fields in the bodies of atoms.
struct VField
{
  std::string_view m_Atom;
  uint64_t m_Offset;
  uint32_t VTrack::*m_pTarget;
};

constexpr std::array Fields = {
  VField{ "tkhd", 12, &VTrack::m_Id },
  VField{ "tkhd", 20, &VTrack::m_Duration },
  VField{ "mdhd", 12, &VTrack::m_Timescale },
  VField{ "mdhd", 16, &VTrack::m_MediaDuration },
  VField{ "stts", 12, &VTrack::m_SamplePeriod },
  VField{ "stsz", 8, &VTrack::m_SampleCount },
  VField{ "co64", 4, &VTrack::m_ChunkCount },
};

constexpr int LargestDepth = 16;   // of atoms in atoms; files have six

struct VHandlerName
{
  std::string_view m_Subtype;
  const char* m_pName;
};

constexpr std::array HandlerNames = { VHandlerName{ "vide", "Video" }, VHandlerName{ "soun", "Audio" }, VHandlerName{ "tmcd", "Timecode" } };

// Throws std::runtime_error with the place for a file that is damaged.
class VTrackReader
{
public:
  VTrackReader( KVZ::IInputStreamSeekable& i_rStream, uint64_t i_Size ) : m_rStream( i_rStream )
  {
    ReadAtoms( 0, i_Size );
    for( VTrack& rTrack : m_Tracks )
    {
      // The one sample of the timecode begins before the movie does.
      if( rTrack.m_Name == "Timecode" )
      {
        rTrack.m_SamplePeriod -= m_TimecodeStart;
      }
    }
  }

  uint32_t Timescale() const { return m_Timescale; }
  const std::vector<VTrack>& Tracks() const { return m_Tracks; }

private:
  std::string Text( uint64_t i_Position )
  {
    std::string Code( 4, '\0' );
    if( !m_rStream.Seek( i_Position ) || !m_rStream.Read( Code.data(), Code.size() ) )
    {
      throw std::runtime_error( "The file cannot be read at " + std::to_string( i_Position ) + "." );
    }
    return Code;
  }

  uint32_t Number( uint64_t i_Position )
  {
    uint32_t Value = 0;
    for( const char Byte : Text( i_Position ) )
    {
      Value = Value << 8 | static_cast<uint8_t>( Byte );
    }
    return Value;
  }

  VAtom ReadHeader( uint64_t i_Position, uint64_t i_End )
  {
    VAtom Atom;
    uint64_t Size = Number( i_Position );
    Atom.m_Type = Text( i_Position + 4 );
    Atom.m_Body = i_Position + 8;
    if( Size == 1 )
    {
      Size = uint64_t{ Number( i_Position + 8 ) } << 32 | Number( i_Position + 12 );
      Atom.m_Body = i_Position + 16;
    }
    if( Size < Atom.m_Body - i_Position || Size > i_End - i_Position )
    {
      throw std::runtime_error( "The '" + Atom.m_Type + "' atom at " + std::to_string( i_Position ) + " has no valid size." );
    }
    Atom.m_End = i_Position + Size;
    return Atom;
  }

  void ReadAtoms( uint64_t i_Position, uint64_t i_End, int i_Depth = 0 )
  {
    if( i_Depth > LargestDepth )
    {
      throw std::runtime_error( "The atoms at " + std::to_string( i_Position ) + " lie too deep in each other." );
    }
    while( i_Position < i_End )
    {
      const VAtom Atom = ReadHeader( i_Position, i_End );
      ReadAtom( Atom, i_Depth );
      i_Position = Atom.m_End;
    }
  }

  void ReadAtom( const VAtom& i_rAtom, int i_Depth )
  {
    if( i_rAtom.m_Type == "trak" )
    {
      m_Tracks.emplace_back();
    }
    if( std::find( Containers.begin(), Containers.end(), i_rAtom.m_Type ) != Containers.end() )
    {
      ReadAtoms( i_rAtom.m_Body, i_rAtom.m_End, i_Depth + 1 );
    }
    else if( i_rAtom.m_Type == "mvhd" )
    {
      m_Timescale = Number( i_rAtom.m_Body + 12 );
    }
    else if( !m_Tracks.empty() )
    {
      ReadTrackFields( i_rAtom, m_Tracks.back() );
    }
  }

  void ReadTrackFields( const VAtom& i_rAtom, VTrack& o_rTrack )
  {
    for( const VField& rField : Fields )
    {
      if( rField.m_Atom == i_rAtom.m_Type )
      {
        o_rTrack.*rField.m_pTarget = Number( i_rAtom.m_Body + rField.m_Offset );
      }
    }
    if( i_rAtom.m_Type == "elst" )
    {
      m_TimecodeStart = Number( i_rAtom.m_Body + 12 );   // of the timecode in the end, which is the last track
    }
    else if( i_rAtom.m_Type == "hdlr" )
    {
      const std::string Subtype = Text( i_rAtom.m_Body + 8 );
      const auto Found = std::find_if( HandlerNames.begin(), HandlerNames.end(),
        [&]( const VHandlerName& i_rName ) { return i_rName.m_Subtype == Subtype; } );
      o_rTrack.m_Name = Found == HandlerNames.end() ? o_rTrack.m_Name : Found->m_pName;
    }
  }

  KVZ::IInputStreamSeekable& m_rStream;
  uint32_t m_Timescale = 0;
  uint32_t m_TimecodeStart = 0;
  std::vector<VTrack> m_Tracks;
};

std::vector<std::string> Fail( const std::string& i_rText )
{
  KVZ_LOG_ERROR( "MovIO", "%1%", i_rText );
  return { i_rText };
}

}

std::vector<std::string> CheckMovFile( const std::string& i_rPath )
{
  UtilsIO::VLargeFile File;
  return File.Open( i_rPath, UtilsIO::EOpenMode::Read ) ? CheckMovStream( File, File.GetSize() ) : Fail( "The file could not be opened." );
}

std::vector<std::string> CheckMovStream( KVZ::IInputStreamSeekable& i_rStream, uint64_t i_Size )
try
{
  const VTrackReader Reader( i_rStream, i_Size );
  if( Reader.Tracks().empty() )
  {
    return Fail( "The file has no tracks: it was not finished." );
  }
  std::vector<std::string> Messages;
  for( const VTrack& rTrack : Reader.Tracks() )
  {
    if( ValidateTrack( rTrack, Reader.Timescale(), &Messages ) )
    {
      GetPeriodInBaseTicks( rTrack, &Messages );
    }
  }
  return Messages;
}
catch( const std::exception& rError )
{
  return Fail( rError.what() );
}

}
