#include "FileIO/TarvoVideo/Reader.h"

#include "CoreVideoUtils/FrameSize.h"
#include "FileIO/WriterSupport/AttributeBlock.h"
#include "Utils/UtilsIO/LargeFile.h"

#include <boost/filesystem/operations.hpp>
#include <boost/format.hpp>

#include <algorithm>
#include <cstring>

namespace TarvoVideo
{

namespace
{

template<class... TArgs>
std::string Text( const char* i_pFormat, const TArgs&... i_rArgs )
{
  boost::format Format( i_pFormat );
  ( Format % ... % i_rArgs );
  return Format.str();
}

// More pixels than any image of a file has; keeps the size arithmetic within 64 bits.
constexpr uint64_t LargestImage = uint64_t{ 1 } << 48;

// Ten days of frames at 100 a second; a file that claims more is damaged.
constexpr uint64_t LargestIndex = 100'000'000;

bool HasKeyOf( const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rGroup, const std::string& i_rExcept )
{
  return std::any_of( i_rAttributes.Values().begin(), i_rAttributes.Values().end(),
    [&]( const auto& i_rEntry ) { return i_rEntry.first.starts_with( i_rGroup ) && i_rEntry.first != i_rExcept; } );
}

// A description that is said to be absent while its fields are there has lost a bit.
template<class TRecord>
bool ReadDescription( TRecord& o_rRecord, const KVZ::IVideoAttributes& i_rAttributes, const std::string& i_rGroup )
{
  const std::string PresentKey = i_rGroup + "Present";
  bool bPresent = false;
  if( !i_rAttributes.Get( PresentKey, bPresent ) || !o_rRecord.ReadAttributes( i_rAttributes ) )
  {
    return false;
  }
  return bPresent != o_rRecord.IsEmpty() && bPresent == HasKeyOf( i_rAttributes, i_rGroup, PresentKey );
}

}

bool VReader::Fail( const std::string& i_rReason )
{
  m_Error = i_rReason;
  return false;
}

bool VReader::Open( const std::string& i_rPath )
{
  // Opening a pipe would wait for its other end.
  boost::system::error_code Error;
  auto pFile = std::make_unique<UtilsIO::VLargeFile>();
  if( !boost::filesystem::is_regular_file( i_rPath, Error ) || !pFile->Open( i_rPath, UtilsIO::EOpenMode::Read ) || !pFile->IsGood() )
  {
    return Fail( "The file could not be opened." );
  }
  const uint64_t Size = pFile->GetSize();
  return Open( std::move( pFile ), Size );
}

bool VReader::Open( std::unique_ptr<KVZ::IInputStreamSeekable> i_pStream, uint64_t i_Size )
{
  *this = VReader();
  m_pStream = std::move( i_pStream );
  m_Size = i_Size;
  uint64_t IndexPosition = 0;
  if( !ReadHeader( IndexPosition ) || !ReadBlock( "internal", m_Internal ) || !ReadBlock( "external", m_External ) || !ReadDescriptions() )
  {
    return false;
  }
  if( !m_pStream->Tell( m_RecordsStart ) )
  {
    return Fail( "The file could not be read." );
  }
  m_bFinished = IndexPosition != 0;
  m_RecordsEnd = m_bFinished ? IndexPosition : m_Size;
  Rewind();
  return !m_bFinished || ( ReadIndex( IndexPosition ) && CheckStarts() );
}

bool VReader::ReadAt( uint64_t i_Position, void* o_pData, size_t i_Size )
{
  return ( m_pStream->Seek( i_Position ) && m_pStream->Read( o_pData, i_Size ) ) ||
    Fail( Text( "%1% bytes at %2% could not be read.", i_Size, i_Position ) );
}

bool VReader::ReadHeader( uint64_t& o_rIndexPosition )
{
  if( m_Size < sizeof( VFixedHeader ) )
  {
    return Fail( Text( "Not a tvid file: it has %1% bytes, and the header alone takes %2%.", m_Size, sizeof( VFixedHeader ) ) );
  }
  const VFixedHeader Expected;
  VFixedHeader Header;
  if( !ReadAt( 0, &Header, sizeof( Header ) ) )
  {
    return false;
  }
  if( std::memcmp( Header.m_Magic, Expected.m_Magic, sizeof( Expected.m_Magic ) ) != 0 )
  {
    return Fail( "Not a tvid file: it does not begin with the words of one." );
  }
  if( std::memcmp( &Header, &Expected, IndexPositionOffset ) != 0 )
  {
    return Fail( "A tvid file of an unknown version, or with a damaged header." );
  }
  o_rIndexPosition = Header.m_IndexPosition;
  return true;
}

bool VReader::ReadBlock( const char* i_pName, KVZ::IVideoAttributes& o_rAttributes )
{
  uint64_t Position = 0;
  if( !m_pStream->Tell( Position ) || Position > m_Size )
  {
    return Fail( "The file could not be read." );
  }
  std::string Reason;
  return WriterSupport::ReadAttributeBlock( *m_pStream, m_Size - Position, o_rAttributes, Reason ) ||
    Fail( Text( "The %1% attribute block at %2% is damaged: %3%.", i_pName, Position, Reason ) );
}

bool VReader::ReadDescriptions()
{
  if( !ReadDescription( m_Video, m_Internal, "VideoFrameInfo." ) || ( !m_Video.IsEmpty() && !m_Video.IsWhole() ) )
  {
    return Fail( "The description of the video is damaged." );
  }
  if( !ReadDescription( m_Audio, m_Internal, "AudioFrameInfo." ) || ( !m_Audio.IsEmpty() && !m_Audio.HasAudio() ) )
  {
    return Fail( "The description of the audio is damaged." );
  }
  if( uint64_t{ m_Video.m_ImageWidth } * m_Video.m_ImageHeight > LargestImage )
  {
    return Fail( Text( "The description of the video is damaged: %1% x %2% pixels.", m_Video.m_ImageWidth, m_Video.m_ImageHeight ) );
  }
  m_VideoBytes = CoreVideoUtils::GetFrameSize( m_Video );
  return true;
}

bool VReader::ReadIndex( uint64_t i_Position )
{
  uint64_t Count = 0;
  if( i_Position < m_RecordsStart || i_Position > m_Size || m_Size - i_Position < sizeof( Count ) )
  {
    return Fail( Text( "The index is said to be at %1%, where it cannot be in a file of %2% bytes.", i_Position, m_Size ) );
  }
  if( !ReadAt( i_Position, &Count, sizeof( Count ) ) )
  {
    return false;
  }
  const uint64_t Room = m_Size - i_Position - sizeof( Count );
  if( Room % sizeof( VIndexEntry ) != 0 || Count != Room / sizeof( VIndexEntry ) )
  {
    return Fail( Text( "The index is said to have %1% entries of %2% bytes, but %3% bytes are there.", Count, sizeof( VIndexEntry ), Room ) );
  }
  if( Count > LargestIndex )
  {
    return Fail( Text( "The index is said to have %1% entries, more than the %2% that are possible.", Count, LargestIndex ) );
  }
  m_Index.resize( Count );
  if( Count != 0 && !ReadAt( i_Position + sizeof( Count ), m_Index.data(), Room ) )
  {
    return false;
  }
  for( size_t Entry = 1; Entry < m_Index.size(); ++Entry )
  {
    if( m_Index[Entry].m_Key <= m_Index[Entry - 1].m_Key )
    {
      return Fail( Text( "The index is damaged: the keys are not in ascending order at entry %1%.", Entry ) );
    }
  }
  return true;
}

// Each indexed record has room for its fixed part before the next one, and before the index.
bool VReader::CheckStarts()
{
  const uint64_t FixedBytes = m_VideoBytes + ( m_Audio.HasAudio() ? sizeof( uint32_t ) : 0 );
  std::transform( m_Index.begin(), m_Index.end(), std::back_inserter( m_Starts ), []( const VIndexEntry& i_rEntry ) { return i_rEntry.m_Position; } );
  std::sort( m_Starts.begin(), m_Starts.end() );
  for( size_t Record = 0; Record < m_Starts.size(); ++Record )
  {
    const uint64_t Limit = Record + 1 < m_Starts.size() ? m_Starts[Record + 1] : m_RecordsEnd;
    if( m_Starts[Record] < m_RecordsStart || m_Starts[Record] > Limit || Limit - m_Starts[Record] < FixedBytes )
    {
      return Fail( Text( "The index is damaged: a frame of %1% bytes cannot be at %2%.", FixedBytes, m_Starts[Record] ) );
    }
  }
  return true;
}

void VReader::Rewind() { m_Cursor = { 0, m_RecordsStart }; }

bool VReader::Next( VFrameRecord& o_rRecord ) { return m_bFinished ? ReadIndexed( o_rRecord ) : ReadWalked( o_rRecord ); }

bool VReader::ReadIndexed( VFrameRecord& o_rRecord )
{
  if( m_Cursor.m_Number >= m_Index.size() )
  {
    return false;
  }
  const VIndexEntry& rEntry = m_Index[m_Cursor.m_Number];
  o_rRecord = { rEntry.m_Key, { rEntry.m_Position, m_VideoBytes }, { rEntry.m_Position + m_VideoBytes, 0 } };
  if( m_Audio.HasAudio() )
  {
    uint32_t AudioBytes = 0;
    if( !ReadAt( o_rRecord.m_Audio.m_Position, &AudioBytes, sizeof( AudioBytes ) ) )
    {
      return false;
    }
    o_rRecord.m_Audio = { o_rRecord.m_Audio.m_Position + sizeof( AudioBytes ), AudioBytes };
    const auto After = std::upper_bound( m_Starts.begin(), m_Starts.end(), rEntry.m_Position );
    const uint64_t Limit = After == m_Starts.end() ? m_RecordsEnd : *After;
    if( AudioBytes > Limit - o_rRecord.m_Audio.m_Position )
    {
      return Fail(
        Text( "Frame %1% at %2% is damaged: %3% bytes of audio do not fit before %4%.", rEntry.m_Key, rEntry.m_Position, AudioBytes, Limit ) );
    }
  }
  ++m_Cursor.m_Number;
  return true;
}

bool VReader::ReadWalked( VFrameRecord& o_rRecord )
{
  const bool bAudio = m_Audio.HasAudio();
  const uint64_t FixedBytes = m_VideoBytes + ( bAudio ? sizeof( uint32_t ) : 0 );
  uint64_t Left = m_RecordsEnd - m_Cursor.m_Position;
  if( FixedBytes == 0 || Left < FixedBytes )
  {
    return false;
  }
  Left -= FixedBytes;
  uint32_t AudioBytes = 0;
  if( bAudio && !ReadAt( m_Cursor.m_Position + m_VideoBytes, &AudioBytes, sizeof( AudioBytes ) ) )
  {
    return false;
  }
  if( AudioBytes > Left )
  {
    return false;
  }
  o_rRecord = { m_Cursor.m_Number, { m_Cursor.m_Position, m_VideoBytes }, { m_Cursor.m_Position + FixedBytes, AudioBytes } };
  m_Cursor = { m_Cursor.m_Number + 1, m_Cursor.m_Position + FixedBytes + AudioBytes };
  return true;
}

bool VReader::CountFrames( uint64_t& o_rCount )
{
  if( m_bFinished )
  {
    o_rCount = m_Index.size();
    return true;
  }
  const VCursor Kept = m_Cursor;
  VFrameRecord Record;
  m_Error.clear();
  while( Next( Record ) )
  {
  }
  o_rCount = m_Cursor.m_Number;
  m_Cursor = Kept;
  return m_Error.empty();
}

bool VReader::Read( const VExtent& i_rExtent, const std::function<void( const uint8_t* i_pData, size_t i_Size )>& i_rConsumer )
{
  constexpr uint64_t Piece = 1024 * 1024;
  if( i_rExtent.m_Position > m_Size || i_rExtent.m_Size > m_Size - i_rExtent.m_Position )
  {
    return Fail( Text( "%1% bytes at %2% are not in the file.", i_rExtent.m_Size, i_rExtent.m_Position ) );
  }
  std::vector<uint8_t> Bytes( std::min( Piece, i_rExtent.m_Size ) );
  for( uint64_t Done = 0; Done < i_rExtent.m_Size; )
  {
    const size_t Size = std::min( Piece, i_rExtent.m_Size - Done );
    if( !ReadAt( i_rExtent.m_Position + Done, Bytes.data(), Size ) )
    {
      return false;
    }
    i_rConsumer( Bytes.data(), Size );
    Done += Size;
  }
  return true;
}

}
