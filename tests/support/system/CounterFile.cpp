#include "tests/support/system/CounterFile.h"

#include "tests/support/CounterReader.h"
#include "tests/support/RampReader.h"
#include "tests/support/TvidParser.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>

namespace SystemTests
{

namespace
{

constexpr size_t CounterLines = 32;
constexpr uint32_t FramesUntilLabelTwo = 2;   // drop-frame leaves out labels 00 and 01

struct VLabel
{
  uint32_t m_Hours = 0;
  uint32_t m_Minutes = 0;
  uint32_t m_Seconds = 0;
  uint32_t m_Frames = 0;
};

VLabel ParseLabel( const std::string& i_rText )
{
  VLabel Label;
  EXPECT_EQ( 4, std::sscanf( i_rText.c_str(), "%2u:%2u:%2u%*[:;]%2u", &Label.m_Hours, &Label.m_Minutes, &Label.m_Seconds, &Label.m_Frames ) );
  return Label;
}

bool CarryInto( uint32_t& io_rField, uint32_t i_Limit )
{
  io_rField = ( io_rField + 1 ) % i_Limit;
  return io_rField == 0;
}

void Advance( VLabel& io_rLabel, const VSignalRate& i_rRate )
{
  if( CarryInto( io_rLabel.m_Frames, i_rRate.m_NominalFrames ) && CarryInto( io_rLabel.m_Seconds, 60 ) )
  {
    if( CarryInto( io_rLabel.m_Minutes, 60 ) )
    {
      CarryInto( io_rLabel.m_Hours, 24 );
    }
    if( i_rRate.m_bDropFrame && io_rLabel.m_Minutes % 10 != 0 )
    {
      io_rLabel.m_Frames = FramesUntilLabelTwo;
    }
  }
}

std::string ToText( const VLabel& i_rLabel, const VSignalRate& i_rRate )
{
  char Text[64];
  std::snprintf( Text, sizeof( Text ), "%02u:%02u:%02u%c%02u", i_rLabel.m_Hours, i_rLabel.m_Minutes, i_rLabel.m_Seconds,
    i_rRate.m_bDropFrame ? ';' : ':', i_rLabel.m_Frames );
  return Text;
}

// How many labels lie between midnight and this one: the nominal count, less what drop-frame has left out.
int64_t LabelsSinceMidnight( const VLabel& i_rLabel, const VSignalRate& i_rRate )
{
  const int64_t Minutes = i_rLabel.m_Hours * 60 + i_rLabel.m_Minutes;
  const int64_t Nominal = ( Minutes * 60 + i_rLabel.m_Seconds ) * i_rRate.m_NominalFrames + i_rLabel.m_Frames;
  return i_rRate.m_bDropFrame ? Nominal - 2 * ( Minutes - Minutes / 10 ) : Nominal;
}

}

std::string CounterCardText( const VSignalRate& i_rRate, const std::string& i_rMore )
{
  return std::string( i_rRate.m_pKind ) + ":pattern=counter,audio=ramp,standard=" + i_rRate.m_pStandard + ( i_rMore.empty() ? "" : "," ) + i_rMore;
}

VArguments CounterCard( const VSignalRate& i_rRate, const std::string& i_rMore )
{
  return { "--card", CounterCardText( i_rRate, i_rMore ), "--pixel-format", "U8Y8V8Y8" };
}

std::vector<VCounterFrame> ReadCounterFile( const std::string& i_rPath )
{
  TestSupport::VTvidParser File( i_rPath );
  const size_t RowBytes = size_t{ File.Width() } * 2;
  std::vector<uint8_t> Background;
  std::vector<VCounterFrame> Frames;
  for( const TestSupport::VTvidParser::VFrame& rFrame : File.Frames() )
  {
    SCOPED_TRACE( i_rPath + ", frame " + std::to_string( Frames.size() ) );
    EXPECT_EQ( Frames.size(), rFrame.m_Key );
    VCounterFrame Frame;
    const std::vector<uint8_t> Picture = File.Video( rFrame );
    const auto Counter = TestSupport::ReadCounter( { KVZ::IPixelFormat::EU8Y8V8Y8, Picture.data(), RowBytes } );
    EXPECT_TRUE( Counter ) << "no counter in the picture";
    Frame.m_Counter = Counter.value_or( 0 );
    if( Background.empty() )
    {
      Background.assign( Picture.begin() + static_cast<std::ptrdiff_t>( RowBytes * CounterLines ), Picture.end() );
    }
    EXPECT_TRUE(
      std::equal( Background.begin(), Background.end(), Picture.begin() + static_cast<std::ptrdiff_t>( RowBytes * CounterLines ), Picture.end() ) )
      << "the picture below the counter differs from the first frame's";
    if( File.Channels() != 0 )
    {
      const std::vector<uint16_t> Sound = File.Audio( rFrame );
      Frame.m_Samples = static_cast<uint32_t>( Sound.size() ) / File.Channels();
      const auto First = TestSupport::ReadRamp(
        { reinterpret_cast<const uint8_t*>( Sound.data() ), Frame.m_Samples, File.Channels(), sizeof( uint16_t ) }, File.Channels() );
      EXPECT_TRUE( First ) << "no ramp in the sound";
      Frame.m_FirstSample = First.value_or( 0 );
    }
    Frames.push_back( Frame );
  }
  return Frames;
}

std::vector<VCounterFrame> ReadUnbroken( const std::string& i_rPath, const VSignalRate& i_rRate )
{
  const std::vector<VCounterFrame> Frames = ReadCounterFile( i_rPath );
  ExpectUnbroken( Frames, i_rRate );
  return Frames;
}

std::vector<uint32_t> DecodeCounters( const std::string& i_rPath, uint32_t i_Width, uint32_t i_Height )
{
  const VRunResult Run = TestSupport::RunProgram(
    { "ffmpeg", "-nostdin", "-v", "error", "-i", i_rPath, "-map", "0:v", "-fps_mode", "passthrough", "-pix_fmt", "uyvy422", "-f", "rawvideo", "-" } );
  const size_t RowBytes = size_t{ i_Width } * 2;
  std::vector<uint32_t> Counters;
  for( size_t Position = 0; Position + RowBytes * i_Height <= Run.m_Output.size(); Position += RowBytes * i_Height )
  {
    const auto* pImage = reinterpret_cast<const uint8_t*>( Run.m_Output.data() ) + Position;
    Counters.push_back( TestSupport::ReadCounter( { KVZ::IPixelFormat::EU8Y8V8Y8, pImage, RowBytes } ).value_or( 0xFFFFFFFF ) );
  }
  return Counters;
}

void ExpectUnbroken( const std::vector<VCounterFrame>& i_rFrames, const VSignalRate& i_rRate )
{
  for( size_t Index = 0; Index < i_rFrames.size(); ++Index )
  {
    const VCounterFrame& rFrame = i_rFrames[Index];
    ASSERT_EQ( i_rRate.m_SampleCadence[rFrame.m_Counter % i_rRate.m_SampleCadence.size()], rFrame.m_Samples ) << "frame " << Index;
    if( Index > 0 )
    {
      const VCounterFrame& rBefore = i_rFrames[Index - 1];
      ASSERT_EQ( rBefore.m_Counter + 1, rFrame.m_Counter ) << "frame " << Index;
      const auto LeftOut = static_cast<uint16_t>( rFrame.m_FirstSample - rBefore.m_FirstSample - rBefore.m_Samples );
      ASSERT_LE( LeftOut, i_rRate.m_SamplesLeftOut ) << "frame " << Index;
    }
  }
}

std::string LabelOfFrame( const std::string& i_rStartLabel, const VSignalRate& i_rRate, uint32_t i_Frame )
{
  VLabel Label = ParseLabel( i_rStartLabel );
  for( uint32_t Passed = 0; Passed < i_Frame / i_rRate.m_FramesPerLabel; ++Passed )
  {
    Advance( Label, i_rRate );
  }
  return ToText( Label, i_rRate );
}

int64_t TickOfFrame( const std::string& i_rStartLabel, const VSignalRate& i_rRate, uint32_t i_Frame )
{
  return LabelsSinceMidnight( ParseLabel( i_rStartLabel ), i_rRate ) * i_rRate.m_Period * i_rRate.m_FramesPerLabel + i_Frame * i_rRate.m_Period;
}

}
