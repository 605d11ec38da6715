#include "tests/support/TvidParser.h"

#include "tests/support/ParserCheck.h"

#include <cstring>
#include <stdexcept>

namespace TestSupport
{

namespace
{

uint64_t ImageSize( const std::string& i_rFormat, uint64_t i_Width, uint64_t i_Height )
{
  if( i_rFormat == "Luminance8" )
  {
    return i_Width * i_Height;
  }
  if( i_rFormat == "U8Y8V8Y8" )
  {
    return 2 * i_Width * i_Height;
  }
  if( i_rFormat == "U10Y10V10Y10" )
  {
    return ( i_Width + 47 ) / 48 * 128 * i_Height;
  }
  if( i_rFormat == "B8G8R8u8" )
  {
    return 4 * i_Width * i_Height;
  }
  if( i_rFormat == "R8G8B8" )
  {
    return 3 * i_Width * i_Height;
  }
  throw std::runtime_error( "tvid: no size known for pixel format " + i_rFormat );
}

}

VTvidParser::VTvidParser( const std::string& i_rPath ) : m_File( i_rPath, std::ios::binary | std::ios::ate )
{
  Require( m_File.is_open(), "cannot open " + i_rPath, 0 );
  m_Size = static_cast<uint64_t>( m_File.tellg() );
  m_File.seekg( 0 );
  ReadHeader();
  m_Internal = ReadBlock();
  m_External = ReadBlock();
  m_RecordsStart = static_cast<uint64_t>( m_File.tellg() );
  ReadDescription();
  if( m_bFinished )
  {
    ReadIndex();
  }
  else
  {
    WalkRecords();
  }
}

template<class T>
T VTvidParser::Read()
{
  T Value{};
  const uint64_t Position = static_cast<uint64_t>( m_File.tellg() );
  m_File.read( reinterpret_cast<char*>( &Value ), sizeof( Value ) );
  Require( m_File.good(), "cut short", Position );
  return Value;
}

std::string VTvidParser::ReadText()
{
  const uint32_t Length = Read<uint32_t>();
  Require( Length <= m_Size, "a text longer than the file", static_cast<uint64_t>( m_File.tellg() ) );
  std::string Text( Length, '\0' );
  m_File.read( Text.data(), Length );
  Require( m_File.good(), "a text is cut short", m_Size );
  return Text;
}

VTvidParser::VValue VTvidParser::ReadValue( uint32_t i_Tag )
{
  switch( i_Tag )
  {
    case 0: return Read<uint8_t>() != 0;
    case 1: return int64_t{ Read<int8_t>() };
    case 2: return int64_t{ Read<int16_t>() };
    case 3: return int64_t{ Read<int32_t>() };
    case 4: return Read<int64_t>();
    case 5: return uint64_t{ Read<uint8_t>() };
    case 6: return uint64_t{ Read<uint16_t>() };
    case 7: return uint64_t{ Read<uint32_t>() };
    case 8: return Read<uint64_t>();
    case 9: return double{ Read<float>() };
    case 10: return Read<double>();
    case 11: return ReadText();
    default: throw std::runtime_error( "tvid: unknown type tag " + std::to_string( i_Tag ) );
  }
}

VTvidParser::VAttributes VTvidParser::ReadBlock()
{
  VAttributes Attributes;
  std::string Previous;
  const uint32_t Count = Read<uint32_t>();
  for( uint32_t Entry = 0; Entry < Count; ++Entry )
  {
    std::string Key = ReadText();
    Require( Entry == 0 || Previous < Key, "keys out of order, " + Key, static_cast<uint64_t>( m_File.tellg() ) );
    Attributes[Key] = ReadValue( Read<uint32_t>() );
    Previous = std::move( Key );
  }
  return Attributes;
}

void VTvidParser::ReadHeader()
{
  char Magic[20];
  m_File.read( Magic, sizeof( Magic ) );
  Require( m_File.good() && std::memcmp( Magic, "###TarvoVideoFile###", sizeof( Magic ) ) == 0, "wrong first words", 0 );
  Require( Read<uint32_t>() == 0x9F31C19C, "wrong constant", 20 );
  Require( Read<uint32_t>() == 1, "wrong constant", 24 );
  Require( Read<uint32_t>() == 2, "wrong constant", 28 );
  Require( Read<uint64_t>() == 1, "wrong constant", 32 );
  m_IndexPosition = Read<uint64_t>();
  m_bFinished = m_IndexPosition != 0;
}

void VTvidParser::ReadDescription()
{
  m_Width = static_cast<uint32_t>( Number( "VideoFrameInfo.ImageWidth" ) );
  m_Height = static_cast<uint32_t>( Number( "VideoFrameInfo.ImageHeight" ) );
  m_ImageSize = ImageSize( Text( "VideoFrameInfo.PixelFormat" ), m_Width, m_Height );
  if( Number( "AudioFrameInfo.Present" ) != 0 )
  {
    m_Channels = static_cast<uint32_t>( Number( "AudioFrameInfo.Channels" ) );
  }
}

bool VTvidParser::ReadRecord( uint64_t i_Key, uint64_t i_Position, uint64_t i_Limit )
{
  VFrame Frame{ i_Key, i_Position, m_ImageSize, i_Position + m_ImageSize, 0 };
  if( Frame.m_AudioPosition > i_Limit )
  {
    return false;
  }
  if( m_Channels != 0 )
  {
    if( Frame.m_AudioPosition + 4 > i_Limit )
    {
      return false;
    }
    m_File.clear();
    m_File.seekg( static_cast<std::streamoff>( Frame.m_AudioPosition ) );
    Frame.m_AudioSize = Read<uint32_t>();
    Frame.m_AudioPosition += 4;
  }
  if( Frame.m_AudioPosition + Frame.m_AudioSize > i_Limit )
  {
    return false;
  }
  m_Frames.push_back( Frame );
  return true;
}

void VTvidParser::ReadIndex()
{
  m_File.seekg( static_cast<std::streamoff>( m_IndexPosition ) );
  const uint64_t Count = Read<uint64_t>();
  Require( m_IndexPosition + 8 + 16 * Count == m_Size, "the index does not end the file", m_IndexPosition );
  std::vector<std::pair<uint64_t, uint64_t>> Entries;
  for( uint64_t Entry = 0; Entry < Count; ++Entry )
  {
    const uint64_t Key = Read<uint64_t>();
    Require( Entries.empty() || Entries.back().first < Key, "index keys out of order", m_IndexPosition );
    Entries.emplace_back( Key, Read<uint64_t>() );
  }
  for( const auto& rEntry : Entries )
  {
    Require( rEntry.second >= m_RecordsStart && ReadRecord( rEntry.first, rEntry.second, m_IndexPosition ), "no room for a record", rEntry.second );
  }
}

void VTvidParser::WalkRecords()
{
  uint64_t Position = m_RecordsStart;
  while( ReadRecord( m_Frames.size(), Position, m_Size ) )
  {
    Position = m_Frames.back().m_AudioPosition + m_Frames.back().m_AudioSize;
  }
}

std::vector<uint8_t> VTvidParser::Bytes( uint64_t i_Position, uint64_t i_Size )
{
  std::vector<uint8_t> Bytes( i_Size );
  m_File.clear();
  m_File.seekg( static_cast<std::streamoff>( i_Position ) );
  m_File.read( reinterpret_cast<char*>( Bytes.data() ), static_cast<std::streamsize>( i_Size ) );
  Require( m_File.good(), "cut short", i_Position );
  return Bytes;
}

std::vector<uint16_t> VTvidParser::Audio( const VFrame& i_rFrame )
{
  const std::vector<uint8_t> Raw = Bytes( i_rFrame.m_AudioPosition, i_rFrame.m_AudioSize );
  std::vector<uint16_t> Samples( Raw.size() / sizeof( uint16_t ) );
  std::memcpy( Samples.data(), Raw.data(), Samples.size() * sizeof( uint16_t ) );
  return Samples;
}

const VTvidParser::VValue* VTvidParser::Find( const std::string& i_rKey ) const
{
  for( const VAttributes* pBlock : { &m_Internal, &m_External } )
  {
    const auto Found = pBlock->find( i_rKey );
    if( Found != pBlock->end() )
    {
      return &Found->second;
    }
  }
  return nullptr;
}

int64_t VTvidParser::Number( const std::string& i_rKey ) const
{
  const VValue* const pValue = Find( i_rKey );
  Require( pValue && !std::holds_alternative<std::string>( *pValue ), "no number " + i_rKey, m_RecordsStart );
  return std::visit(
    []( const auto& i_rValue ) -> int64_t
    {
      if constexpr( std::is_same_v<std::decay_t<decltype( i_rValue )>, std::string> )
      {
        return 0;
      }
      else
      {
        return static_cast<int64_t>( i_rValue );
      }
    },
    *pValue );
}

std::string VTvidParser::Text( const std::string& i_rKey ) const
{
  const VValue* const pValue = Find( i_rKey );
  Require( pValue && std::holds_alternative<std::string>( *pValue ), "no text " + i_rKey, m_RecordsStart );
  return std::get<std::string>( *pValue );
}

}
