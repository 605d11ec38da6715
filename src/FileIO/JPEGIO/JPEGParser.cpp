#include "FileIO/JPEGIO/JPEGParser.h"

#include "FileIO/JPEGIO/JPEGMarkers.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <span>

namespace JPEGIO
{

namespace
{

constexpr size_t LeastSegments = 4;   // SOI, a frame, a scan, EOI

// Sees a part of the stream at a time: nearly all of an image is entropy coded data, which is gone through byte by byte.
class VWindow
{
public:
  VWindow( KVZ::IInputStreamSeekable& io_rStream, uint64_t i_Size ) : m_rStream( io_rStream ), m_Size( i_Size ) {}

  // The bytes from there on, i_Least or more where the data has as many. Empty for a stream that fails.
  std::span<const uint8_t> At( uint64_t i_Position, size_t i_Least )
  {
    if( i_Position < m_Start || i_Position + i_Least > m_Start + m_Count )
    {
      Load( i_Position );
    }
    return { m_Bytes.data() + ( i_Position - m_Start ), m_Count - ( i_Position - m_Start ) };
  }

private:
  void Load( uint64_t i_Position )
  {
    m_Start = i_Position;
    m_Count = 0;
    const size_t Wanted = std::min<uint64_t>( m_Bytes.size(), m_Size - i_Position );
    if( !m_rStream.Seek( i_Position ) || !m_rStream.ReadBlock( m_Bytes.data(), Wanted, m_Count ) )
    {
      m_Count = 0;
    }
  }

  KVZ::IInputStreamSeekable& m_rStream;
  const uint64_t m_Size;
  uint64_t m_Start = 0;
  size_t m_Count = 0;
  std::array<uint8_t, 4096> m_Bytes;
};

class VParser
{
public:
  VParser( KVZ::IInputStreamSeekable& io_rStream, uint64_t i_Size, std::vector<VJPEGSegment>& o_rSegments )
    : m_rSegments( o_rSegments ), m_Window( io_rStream, i_Size ), m_Size( i_Size )
  {
  }

  bool Parse( uint64_t i_Start )
  {
    m_Position = i_Start;
    EStep Step = EStep::On;
    while( Step == EStep::On && m_Position < m_Size )
    {
      Step = TakeNext();
    }
    return Step != EStep::Refused && CheckWhole();
  }

private:
  enum class EStep
  {
    On,
    Ended,     // the data is too short for what it says
    Refused,   // reported
  };

  EStep TakeNext()
  {
    const std::span<const uint8_t> Bytes = m_Window.At( m_Position, 2 );
    if( !Bytes.empty() && Bytes[0] != 0xFF )
    {
      return SkipData( Bytes );
    }
    if( Bytes.size() < 2 )
    {
      return EStep::Ended;
    }
    return Bytes[1] == Marker::Stuffing ? SkipStuffing() : TakeSegment( Bytes[1] );
  }

  EStep SkipData( std::span<const uint8_t> i_Bytes )
  {
    if( !m_bInScan )
    {
      KVZ_LOG_ERROR( "JPEGIO", "Unrecognised data found in buffer at 0x%x", m_Position );
      return EStep::Refused;
    }
    const void* const pNext = std::memchr( i_Bytes.data(), 0xFF, i_Bytes.size() );
    m_Position += pNext ? static_cast<size_t>( static_cast<const uint8_t*>( pNext ) - i_Bytes.data() ) : i_Bytes.size();
    return EStep::On;
  }

  EStep SkipStuffing()
  {
    if( !m_bInScan )
    {
      KVZ_LOG_ERROR( "JPEGIO", "0xff00 found outside of image scan." );
      return EStep::Refused;
    }
    m_Position += 2;
    return EStep::On;
  }

  EStep TakeSegment( uint8_t i_Marker )
  {
    uint64_t Length = 0;
    if( MarkerLengths[i_Marker] == MarkerLength::Follows )
    {
      const std::span<const uint8_t> Bytes = m_Window.At( m_Position, 4 );
      if( Bytes.size() < 4 )
      {
        return EStep::Ended;
      }
      Length = 2 + ( uint64_t{ Bytes[2] } << 8 | Bytes[3] );
      m_bInScan = m_bInScan || i_Marker == Marker::StartOfScan;
    }
    else if( MarkerLengths[i_Marker] < MarkerLength::Alone )
    {
      KVZ_LOG_ERROR( "JPEGIO", "Unsupported JPEG segment found 0xff%02x", i_Marker );
      return EStep::Refused;
    }
    else
    {
      Length = static_cast<uint64_t>( MarkerLengths[i_Marker] );
    }
    if( Length > m_Size - m_Position )
    {
      return EStep::Ended;
    }
    m_rSegments.push_back( { i_Marker, m_Position, Length } );
    m_Position += Length;
    return EStep::On;
  }

  bool CheckWhole() const
  {
    const char* pFault = nullptr;
    if( m_Position != m_Size )
    {
      pFault = "Did not end cleanly.  Data may be truncated or corrupt.";
    }
    else if( m_rSegments.size() < LeastSegments )
    {
      pFault = "Not enough segments.  Data may be truncated or corrupt.";
    }
    else if( m_rSegments.front().m_Marker != Marker::StartOfImage )
    {
      pFault = "Missing SOI marker.";
    }
    else if( m_rSegments.back().m_Marker != Marker::EndOfImage )
    {
      pFault = "Missing EOI marker.";
    }
    if( pFault )
    {
      KVZ_LOG_ERROR( "JPEGIO", pFault );
    }
    return !pFault;
  }

  std::vector<VJPEGSegment>& m_rSegments;
  VWindow m_Window;
  const uint64_t m_Size;
  uint64_t m_Position = 0;
  bool m_bInScan = false;   // once a scan has begun, for good
};

class VMemoryStream : public KVZ::IInputStreamSeekable
{
public:
  VMemoryStream( const uint8_t* i_pData, size_t i_Size ) : m_pData( i_pData ), m_Size( i_Size ) {}

  bool Read( void* o_pData, size_t i_Size ) override
  {
    size_t Count = 0;
    return ReadBlock( o_pData, i_Size, Count ) && Count == i_Size;
  }
  bool ReadBlock( void* o_pData, size_t i_Size, size_t& o_rRead ) override
  {
    o_rRead = std::min( i_Size, m_Size - m_Position );
    std::copy_n( m_pData + m_Position, o_rRead, static_cast<uint8_t*>( o_pData ) );
    m_Position += o_rRead;
    return true;
  }
  bool IsGood() const override { return true; }
  bool IsEnd() const override { return m_Position == m_Size; }
  bool Tell( uint64_t& o_rPosition ) override
  {
    o_rPosition = m_Position;
    return true;
  }
  bool Seek( uint64_t i_Position ) override
  {
    const bool bInside = i_Position <= m_Size;
    m_Position = bInside ? static_cast<size_t>( i_Position ) : m_Position;
    return bInside;
  }

private:
  const uint8_t* const m_pData;
  const size_t m_Size;
  size_t m_Position = 0;
};

}

bool ParseJPEGSegments( KVZ::IInputStreamSeekable& io_rStream, uint64_t i_Size, std::vector<VJPEGSegment>& o_rSegments )
{
  o_rSegments.clear();
  uint64_t Start = 0;
  io_rStream.Tell( Start );
  return VParser( io_rStream, i_Size, o_rSegments ).Parse( Start );
}

bool ParseJPEGSegments( const uint8_t* i_pImage, size_t i_Size, std::vector<VJPEGSegment>& o_rSegments )
{
  VMemoryStream Stream( i_pImage, i_Size );
  return ParseJPEGSegments( Stream, i_Size, o_rSegments );
}

}
