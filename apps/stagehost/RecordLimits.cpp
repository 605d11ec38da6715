#include "apps/stagehost/RecordLimits.h"

#include "FileIO/MovIO/MovTiming.h"
#include "FileIO/RapidAVI/Format.h"
#include "FileIO/RapidAVI/Segments.h"

#include <algorithm>
#include <cstdio>

namespace
{

constexpr double TicksPerSecond = 135000000.0;
constexpr double SecondsPerHour = 3600.0;
constexpr double SecondsPerDay = 24 * SecondsPerHour;
constexpr double LargestNumber = 4294967295.0;   // of 32 bits
constexpr double WarningShare = 0.95;
constexpr double WarningSeconds = 600.0;   // before the limit, at most

double Sooner( double i_A, double i_B ) { return std::min( i_A, i_B ); }

// All tracks count their length in units of one timescale.
VRunLimit OfMovie( const VStoredFormat& i_rFormat )
{
  KVZ::VTimingRecord Base;
  if( i_rFormat.m_FramePeriod == 0 || !MovIO::ToBaseTicks( { 135000000, i_rFormat.m_FramePeriod, 0 }, Base ) )
  {
    return {};
  }
  MovIO::VPeriods Periods;
  Periods.m_Video = Base.m_FramePeriodInTicks;
  Periods.m_Timecode = MovIO::GetTimecodePeriod( MovIO::GetStartTimecode( {}, Base.m_FramePeriodInTicks ).m_Standard );
  Periods.m_Audio = i_rFormat.m_Audio.HasAudio() ? MovIO::BaseTicksPerSecond / i_rFormat.m_Audio.m_SampleRate : 0;
  if( !MovIO::Reduce( Periods ) )
  {
    return {};
  }
  const char* const pWhat = i_rFormat.m_Container == KVZ::IVideoContainer::EMOV ? "a MOV file" : "an MP4 file";
  return { LargestNumber / static_cast<double>( Periods.m_Timescale ), pWhat };
}

// The headers count frames and samples; the super index has places for so many RIFFs.
VRunLimit OfAvi( const VStoredFormat& i_rFormat )
{
  constexpr RapidAVI::VSegmentLimits Riffs;
  constexpr auto IndexedBytes = static_cast<double>( Riffs.m_First + ( RapidAVI::SuperIndexEntries - 1 ) * Riffs.m_Following );
  const KVZ::AudioFrameInfo& rAudio = i_rFormat.m_Audio;
  const double Period = i_rFormat.m_FramePeriod / TicksPerSecond;
  const double Frames = Period > 0.0 ? LargestNumber * Period : VRunLimit::Endless;
  const double Samples = rAudio.HasAudio() ? LargestNumber / rAudio.m_SampleRate : VRunLimit::Endless;
  double Index = VRunLimit::Endless;
  if( i_rFormat.m_ImageBytes != 0 && Period > 0.0 )
  {
    const double SoundBytes = 1.0 * KVZ::GetBytesPerSample( rAudio.m_SampleFormat ) * rAudio.m_Channels * rAudio.m_SampleRate;
    Index = IndexedBytes / ( static_cast<double>( i_rFormat.m_ImageBytes ) / Period + SoundBytes );
  }
  const double Full = Sooner( Frames, Samples );
  return Index < Full ? VRunLimit{ Index, "the index of an AVI file", true } : VRunLimit{ Full, "an AVI file" };
}

std::string TimeText( double i_Seconds )
{
  char Text[32];
  const bool bMinutes = i_Seconds < 2 * SecondsPerHour;
  std::snprintf( Text, sizeof( Text ), bMinutes ? "%.0f minutes" : "%.1f hours", i_Seconds / ( bMinutes ? 60.0 : SecondsPerHour ) );
  return Text;
}

std::string ThenText( const VRunLimit& i_rLimit )
{
  return i_rLimit.m_bIndexAlone ? " Players will not seek to frames that come later." : " No frame is stored that comes later.";
}

}

VRunLimit FindRunLimit( const VStoredFormat& i_rFormat )
{
  switch( i_rFormat.m_Container )
  {
    case KVZ::IVideoContainer::EMOV:
    case KVZ::IVideoContainer::EMP4: return OfMovie( i_rFormat );
    case KVZ::IVideoContainer::EAVI: return OfAvi( i_rFormat );
    default: return {};
  }
}

bool VLimitNotice::IsNear() const { return m_Limit.m_Seconds < SecondsPerDay; }

std::string VLimitNotice::AtStart( double i_RequestedSeconds ) const
{
  const bool bTooLong = i_RequestedSeconds > m_Limit.m_Seconds;
  if( !IsNear() && !bTooLong )
  {
    return {};
  }
  const std::string Text = m_DeviceURN + ": With these settings " + m_Limit.m_What + " is full after " + TimeText( m_Limit.m_Seconds ) + ".";
  return bTooLong ? Text + " The recording is to be longer." + ThenText( m_Limit ) : Text;
}

std::string VLimitNotice::After( double i_CapturedSeconds )
{
  const double WarnAt = std::max( WarningShare * m_Limit.m_Seconds, m_Limit.m_Seconds - WarningSeconds );
  if( m_bWarned || i_CapturedSeconds < WarnAt )
  {
    return {};
  }
  m_bWarned = true;
  const double Left = std::max( 0.0, m_Limit.m_Seconds - i_CapturedSeconds );
  return m_DeviceURN + ": In " + TimeText( Left ) + " " + m_Limit.m_What + " is full." + ThenText( m_Limit );
}
