// Ten minutes, also at 29.97, where sound has a changing number of samples a frame: whether each frame still meets its own samples at the end.
#include "tests/FileIO/Containers/MovieWriters.h"
#include "tests/support/OutsideReaders.h"
#include "tests/support/ProgramRun.h"
#include "tests/support/RampReader.h"
#include "tests/support/TemporaryFolder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <numeric>
#include <sstream>

using namespace Containers;
using namespace TestSupport;

namespace
{

constexpr uint32_t Width = 16;
constexpr uint32_t Height = 2;
constexpr double SampleRate = 48000.0;
constexpr uint64_t RiffBytes = 8 << 20;   // several RIFFs in an AVI

struct VRate
{
  uint32_t m_FramesInTenMinutes;
  uint32_t m_PeriodInTicks;
  std::array<uint32_t, 5> m_Samples;   // of the frames of a cycle
  KVZ::ITimecodeStandard::Enum m_Timecode;

  double Period() const { return m_PeriodInTicks / 135e6; }
};

constexpr VRate Every40ms = { 15000, 5400000, { 1920, 1920, 1920, 1920, 1920 }, KVZ::ITimecodeStandard::ETimecode25 };
constexpr VRate Drop2997 = { 17982, 4504500, { 1602, 1601, 1602, 1601, 1602 }, KVZ::ITimecodeStandard::ETimecode30Drop };

uint64_t SamplesBefore( const VRate& i_rRate, uint64_t i_Frame )
{
  const std::array<uint32_t, 5>& rCycle = i_rRate.m_Samples;
  const uint64_t Rest = i_Frame % rCycle.size();
  return i_Frame / rCycle.size() * std::accumulate( rCycle.begin(), rCycle.end(), uint64_t{ 0 } ) +
    std::accumulate( rCycle.begin(), rCycle.begin() + static_cast<std::ptrdiff_t>( Rest ), uint64_t{ 0 } );
}

// Every pixel pair of a picture is the frame's number, every sample its own number.
VBytes Picture( uint32_t i_Frame )
{
  VBytes Bytes( Width * Height * 2 );
  for( size_t Byte = 0; Byte < Bytes.size(); ++Byte )
  {
    Bytes[Byte] = static_cast<uint8_t>( i_Frame >> Byte % 4 * 8 );
  }
  return Bytes;
}

VBytes Sound( const VRate& i_rRate, uint32_t i_Frame )
{
  VBytes Bytes;
  for( uint64_t Sample = SamplesBefore( i_rRate, i_Frame ); Sample < SamplesBefore( i_rRate, i_Frame + 1 ); ++Sample )
  {
    Bytes.push_back( static_cast<uint8_t>( Sample ) );
    Bytes.push_back( static_cast<uint8_t>( Sample >> 8 ) );
  }
  return Bytes;
}

// When FFmpeg shows each frame, and plays the sample that each piece of sound begins with.
struct VTimes
{
  struct VPiece
  {
    uint64_t m_FirstSample;
    double m_Time;
  };

  // Pieces have no gaps between them.
  double OfSample( uint64_t i_Sample ) const
  {
    const auto Behind = std::upper_bound( m_Sound.begin(), m_Sound.end(), i_Sample,
      []( uint64_t i_Wanted, const VPiece& i_rPiece ) { return i_Wanted < i_rPiece.m_FirstSample; } );
    const VPiece& rPiece = *std::prev( Behind );
    return rPiece.m_Time + static_cast<double>( i_Sample - rPiece.m_FirstSample ) / SampleRate;
  }

  std::vector<double> m_Frames;
  std::vector<VPiece> m_Sound;
};

VTimes AskTimes( const std::string& i_rPath )
{
  const VRunResult Run = RunProgram( { "ffprobe", "-v", "quiet", "-show_entries", "packet=stream_index,pts_time,size", "-of", "csv=p=0", i_rPath } );
  std::istringstream Lines( Run.m_Output );
  VTimes Times;
  uint64_t Samples = 0;
  int Stream = 0;
  char Comma = 0;
  double Time = 0.0;
  for( std::string Line; std::getline( Lines, Line ); )
  {
    uint64_t Bytes = 0;
    std::istringstream Fields( Line );
    Fields >> Stream >> Comma >> Time >> Comma >> Bytes;
    if( Stream == 0 )
    {
      Times.m_Frames.push_back( Time );
    }
    else if( Stream == 1 )
    {
      Times.m_Sound.push_back( { Samples, Time } );
      Samples += Bytes / sizeof( int16_t );
    }
  }
  return Times;
}

struct VLongCase
{
  VContainerRow m_Row;
  VRate m_Rate;
};

// At 29.97 FFmpeg takes every single sample of a MOV file for a frame of its own, which takes it minutes.
constexpr VLongCase Cases[] = { { Mov, Every40ms }, { Avi, Drop2997 }, { Mkv, Drop2997 } };

class LongRecording : public testing::TestWithParam<VLongCase>
{
protected:
  void Write() const
  {
    VHeader Settings = MovieHeader( Width, Height );
    Settings.m_Timing.m_FramePeriodInTicks = m_Rate.m_PeriodInTicks;
    Settings.m_Timecode = { m_Rate.m_Timecode, 1 };
    const auto pWriter = MakeWriter( GetParam().m_Row.m_Container, { .m_RiffBytes = RiffBytes } );
    ASSERT_TRUE( pWriter->Open( m_Path ) && Settings.WriteTo( *pWriter ) );
    for( uint32_t Frame = 0; Frame < m_Rate.m_FramesInTenMinutes; ++Frame )
    {
      ASSERT_TRUE( Settings.WriteFrame( *pWriter, Picture( Frame ), Sound( m_Rate, Frame ), Frame ) );
    }
    ASSERT_TRUE( pWriter->Close() );
  }

  void CheckContent() const
  {
    VBytes Pictures;
    for( uint32_t Frame = 0; Frame < m_Rate.m_FramesInTenMinutes; ++Frame )
    {
      Append( Pictures, Picture( Frame ) );
    }
    ASSERT_TRUE( DecodeVideo( m_Path, "uyvy422" ) == Pictures );
    const VBytes Samples = DecodeAudio( m_Path, "s16le" );
    ASSERT_EQ( Samples.size(), SamplesBefore( m_Rate, m_Rate.m_FramesInTenMinutes ) * sizeof( int16_t ) );
    const auto First = ReadRamp( { Samples.data(), Samples.size() / sizeof( int16_t ), 1 }, 1 );
    EXPECT_TRUE( First && *First == 0 );
  }

  const VRate& m_Rate = GetParam().m_Rate;
  const VTemporaryFolder m_Folder;
  const std::string m_Path = m_Folder.File( std::string( "long." ) + GetParam().m_Row.m_pName );
};

}

TEST_P( LongRecording, KeepsEveryFrameWithItsSound )
{
  Write();
  CheckContent();
  const VTimes Times = AskTimes( m_Path );
  ASSERT_EQ( Times.m_Frames.size(), m_Rate.m_FramesInTenMinutes );
  ASSERT_FALSE( Times.m_Sound.empty() );
  // Matroska counts microseconds and rounds a frame down to whole ones, for sound and pictures alike.
  const bool bMicroseconds = GetParam().m_Row.m_Container == KVZ::IVideoContainer::EMKV;
  const double ShownPeriod = bMicroseconds ? std::floor( m_Rate.Period() * 1e6 ) / 1e6 : m_Rate.Period();
  for( uint32_t Frame = 0; Frame < m_Rate.m_FramesInTenMinutes; ++Frame )
  {
    ASSERT_NEAR( Times.m_Frames[Frame], Frame * ShownPeriod, 2e-6 ) << Frame;
    ASSERT_LT( std::abs( Times.OfSample( SamplesBefore( m_Rate, Frame ) ) - Times.m_Frames[Frame] ), 1.0 / SampleRate ) << Frame;
  }
}

INSTANTIATE_TEST_SUITE_P( Containers, LongRecording, testing::ValuesIn( Cases ), []( const auto& i_rInfo ) { return i_rInfo.param.m_Row.m_pName; } );
