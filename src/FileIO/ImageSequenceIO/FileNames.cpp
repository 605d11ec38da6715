#include "FileIO/ImageSequenceIO/FileNames.h"

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/erase.hpp>
#include <boost/algorithm/string/replace.hpp>
#include <boost/filesystem/path.hpp>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <regex>

namespace ImageSequenceIO
{

namespace
{

constexpr const char* FrameKeyword = "%FRAME%";
constexpr const char* TimecodeKeyword = "%TIMECODE%";
constexpr const char* SideFileExtension = ".tarvovideoattributes";
constexpr uint64_t BaseTicksPerSecond = 135000000;

std::string PaddedNumber( uint64_t i_Number, uint32_t i_Digits )
{
  const std::string Text = std::to_string( i_Number );
  return Text.size() < i_Digits ? std::string( i_Digits - Text.size(), '0' ) + Text : Text;
}

std::string WithoutSeparators( std::string i_Timecode )
{
  i_Timecode.erase( std::remove_if( i_Timecode.begin(), i_Timecode.end(), boost::is_any_of( ":;+" ) ), i_Timecode.end() );
  return i_Timecode;
}

// Ticks of 1/135000000 s; 0 where the period is no whole number of them.
uint64_t PeriodInBaseTicks( const KVZ::VTimingRecord& i_rTiming )
{
  const uint64_t Product = i_rTiming.m_FramePeriodInTicks * BaseTicksPerSecond;
  const uint64_t TicksPerSecond = i_rTiming.m_TicksPerSecond;
  return TicksPerSecond != 0 && Product % TicksPerSecond == 0 ? Product / TicksPerSecond : 0;
}

}

const char* GetImageExtension( KVZ::IVideoPayload::Enum i_Payload )
{
  switch( i_Payload )
  {
    case KVZ::IVideoPayload::EImageJPEG: return "jpg";
    case KVZ::IVideoPayload::EImagePNG: return "png";
    case KVZ::IVideoPayload::EImageTIFF: return "tiff";
    default: return "";
  }
}

std::string MakeFileName( const std::string& i_rPattern, const VFrameName& i_rFrame )
{
  std::string Name = i_rPattern;
  boost::replace_all( Name, FrameKeyword, PaddedNumber( i_rFrame.m_Number, i_rFrame.m_Digits ) );
  boost::replace_all( Name, TimecodeKeyword, WithoutSeparators( KVZ::ToText( i_rFrame.m_Timecode ) ) );
  return Name;
}

std::string MakeSideFileName( const std::string& i_rPattern )
{
  std::string Name = i_rPattern;
  boost::erase_all( Name, FrameKeyword );
  boost::erase_all( Name, TimecodeKeyword );
  return boost::filesystem::path( Name ).replace_extension( SideFileExtension ).string();
}

KVZ::ITimecode TimecodeOfFrame( const KVZ::ITimecode& i_rStart, const KVZ::VTimingRecord& i_rTiming, uint64_t i_FrameNumber )
{
  KVZ::ITimecode Timecode = i_rStart;
  KVZ::AddTicks( Timecode, static_cast<int64_t>( i_FrameNumber * PeriodInBaseTicks( i_rTiming ) ) );
  return Timecode;
}

uint64_t FindFrameNumber( const std::string& i_rFileName, const std::string& i_rPattern )
{
  static const std::regex Special( R"([.^$|()\[\]{}*+?\\])" );
  std::string Expression = std::regex_replace( i_rPattern, Special, R"(\$&)" );
  boost::replace_all( Expression, FrameKeyword, "([0-9]+)" );
  boost::replace_all( Expression, TimecodeKeyword, "[0-9]{10}" );
  std::smatch Match;
  if( !std::regex_search( i_rFileName, Match, std::regex( Expression ) ) || Match.size() < 2 )
  {
    return NoFrameNumber;
  }
  errno = 0;
  const uint64_t Number = std::strtoull( Match[1].str().c_str(), nullptr, 10 );
  return errno == 0 ? Number : NoFrameNumber;
}

}
