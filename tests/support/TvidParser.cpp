#include "tests/support/TvidParser.h"

#include <bit>
#include <cstring>
#include <stdexcept>

namespace TestSupport
{

namespace
{

uint64_t ImageSize( const std::string& i_rFormat, uint64_t i_Width, uint64_t i_Height )
{
  if( i_rFormat == "U10Y10V10Y10" )
  {
    return ( i_Width + 47 ) / 48 * 128 * i_Height;
  }
  static const std::map<std::string, uint64_t> s_BytesAPixel = { { "Luminance8", 1 }, { "U8Y8V8Y8", 2 }, { "R8G8B8", 3 }, { "B8G8R8u8", 4 } };
  Require( s_BytesAPixel.count( i_rFormat ) != 0, "no size known for pixel format " + i_rFormat, 0 );
  return s_BytesAPixel.at( i_rFormat ) * i_Width * i_Height;
}

}

VTvidParser::VTvidParser( const std::string& i_rPath ) : m_File( VFileBytes::OfFile( i_rPath ) )
{
  ReadHeader();
  m_Internal = ReadBlock();
  m_External = ReadBlock();
  m_RecordsStart = m_Cursor;
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

uint64_t VTvidParser::Next( uint64_t i_Bytes )
{
  const uint64_t Value = m_File.Little( m_Cursor, i_Bytes );
  m_Cursor += i_Bytes;
  return Value;
}

std::string VTvidParser::NextText()
{
  const uint64_t Length = Next( 4 );
  m_Cursor += Length;
  return m_File.Text( m_Cursor - Length, Length );
}

VTvidParser::VValue VTvidParser::ReadValue( uint64_t i_Tag )
{
  switch( i_Tag )
  {
    case 0: return Next( 1 ) != 0;
    case 1: return int64_t{ static_cast<int8_t>( Next( 1 ) ) };
    case 2: return int64_t{ static_cast<int16_t>( Next( 2 ) ) };
    case 3: return int64_t{ static_cast<int32_t>( Next( 4 ) ) };
    case 4: return static_cast<int64_t>( Next( 8 ) );
    case 5: return Next( 1 );
    case 6: return Next( 2 );
    case 7: return Next( 4 );
    case 8: return Next( 8 );
    case 9: return double{ std::bit_cast<float>( static_cast<uint32_t>( Next( 4 ) ) ) };
    case 10: return std::bit_cast<double>( Next( 8 ) );
    case 11: return NextText();
    default: throw std::runtime_error( "unknown type tag " + std::to_string( i_Tag ) );
  }
}

VTvidParser::VAttributes VTvidParser::ReadBlock()
{
  VAttributes Attributes;
  for( uint64_t Left = Next( 4 ); Left != 0; --Left )
  {
    const std::string Key = NextText();
    Require( Attributes.empty() || Attributes.rbegin()->first < Key, "keys out of order, " + Key, m_Cursor );
    Attributes[Key] = ReadValue( Next( 4 ) );
  }
  return Attributes;
}

void VTvidParser::ReadHeader()
{
  Require( m_File.Text( 0, 20 ) == "###TarvoVideoFile###", "wrong first words", 0 );
  m_Cursor = 20;
  for( const uint64_t Constant : { 0x9F31C19C, 1u, 2u } )
  {
    Require( Next( 4 ) == Constant, "wrong constant", m_Cursor );
  }
  Require( Next( 8 ) == 1, "wrong constant", m_Cursor );
  m_IndexPosition = Next( 8 );
  m_bFinished = m_IndexPosition != 0;
}

void VTvidParser::ReadDescription()
{
  m_Width = static_cast<uint32_t>( Number( "VideoFrameInfo.ImageWidth" ) );
  const auto Height = static_cast<uint64_t>( Number( "VideoFrameInfo.ImageHeight" ) );
  m_ImageSize = ImageSize( Text( "VideoFrameInfo.PixelFormat" ), m_Width, Height );
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
    Frame.m_AudioSize = m_File.Little( Frame.m_AudioPosition, 4 );
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
  m_Cursor = m_IndexPosition;
  const uint64_t Count = Next( 8 );
  Require( m_Cursor + 16 * Count == m_File.Size(), "the index does not end the file", m_IndexPosition );
  for( uint64_t Entry = 0; Entry < Count; ++Entry )
  {
    const uint64_t Key = Next( 8 );
    const uint64_t Position = Next( 8 );
    Require( Entry == 0 || m_Frames.back().m_Key < Key, "index keys out of order", m_Cursor );
    Require( Position >= m_RecordsStart && ReadRecord( Key, Position, m_IndexPosition ), "no room for a record", Position );
  }
}

void VTvidParser::WalkRecords()
{
  uint64_t Position = m_RecordsStart;
  while( ReadRecord( m_Frames.size(), Position, m_File.Size() ) )
  {
    Position = m_Frames.back().m_AudioPosition + m_Frames.back().m_AudioSize;
  }
}

std::vector<uint16_t> VTvidParser::Audio( const VFrame& i_rFrame ) const
{
  const std::vector<uint8_t> Raw = m_File.Read( i_rFrame.m_AudioPosition, i_rFrame.m_AudioSize );
  std::vector<uint16_t> Samples( Raw.size() / sizeof( uint16_t ) );
  std::memcpy( Samples.data(), Raw.data(), Samples.size() * sizeof( uint16_t ) );
  return Samples;
}

const VTvidParser::VValue& VTvidParser::Find( const std::string& i_rKey ) const
{
  const VAttributes& rBlock = m_Internal.count( i_rKey ) != 0 ? m_Internal : m_External;
  Require( rBlock.count( i_rKey ) != 0, "no " + i_rKey, m_RecordsStart );
  return rBlock.at( i_rKey );
}

int64_t VTvidParser::Number( const std::string& i_rKey ) const
{
  const VValue& rValue = Find( i_rKey );
  if( const auto* const pUnsigned = std::get_if<uint64_t>( &rValue ) )
  {
    return static_cast<int64_t>( *pUnsigned );
  }
  const auto* const pSigned = std::get_if<int64_t>( &rValue );
  return pSigned ? *pSigned : std::get<bool>( rValue );
}

std::string VTvidParser::Text( const std::string& i_rKey ) const { return std::get<std::string>( Find( i_rKey ) ); }

}
