#include "FileIO/MovIO/TrackValidation.h"

#include "FileIO/MovIO/MovTiming.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <array>
#include <cmath>

namespace MovIO
{

namespace
{

constexpr double LargestDifference = 0.1;   // seconds

// Tells about one track.
class VTeller
{
public:
  VTeller( const VTrack& i_rTrack, std::vector<std::string>* o_pMessages ) : m_rTrack( i_rTrack ), m_pMessages( o_pMessages ) {}

  template<class... TArguments>
  void Tell( const char* i_pFormat, const TArguments&... i_rArguments ) const
  {
    const std::array<KVZ::VLogArgument, 2 + sizeof...( TArguments )> Arguments{ m_rTrack.m_Name, m_rTrack.m_Id, i_rArguments... };
    const std::string Text = KVZ::FormatLogMessage( i_pFormat, Arguments.data(), Arguments.size() );
    KVZ_LOG_ERROR( "MovIO", "%1%", Text );
    if( m_pMessages )
    {
      m_pMessages->push_back( Text );
    }
  }

  void TellInexactTimescale() const { Tell( "%s track (%d) has a timescale that cannot be exactly represented in 1080MHz ticks." ); }

private:
  const VTrack& m_rTrack;
  std::vector<std::string>* const m_pMessages;
};

void CompareDurations( const VTrack& i_rTrack, uint32_t i_MovieTimescale, const VTeller& i_rTeller )
{
  if( i_MovieTimescale == 0 || i_rTrack.m_Timescale == 0 )
  {
    return;
  }
  const double InFile = static_cast<double>( i_rTrack.m_Duration ) / i_MovieTimescale;
  const double InTrack = static_cast<double>( i_rTrack.m_MediaDuration ) / i_rTrack.m_Timescale;
  const double Difference = std::abs( InFile - InTrack );
  if( Difference > LargestDifference )
  {
    i_rTeller.Tell( "%s track (%d) has a duration in the file timescale (%ds) that doesn't match the duration in the track timescale (%ds). "
                    "Difference is %ds.",
      InFile, InTrack, Difference );
  }
}

}

bool ValidateTrack( const VTrack& i_rTrack, uint32_t i_MovieTimescale, std::vector<std::string>* o_pMessages )
{
  const VTeller Teller( i_rTrack, o_pMessages );
  if( i_rTrack.m_SampleCount == 0 )
  {
    Teller.Tell( "%s track (%d) has no samples." );
    return false;
  }
  if( i_rTrack.m_ChunkCount == 0 )
  {
    Teller.Tell( "%s track (%d) has no chunks." );
    return false;
  }
  if( i_rTrack.m_Timescale == 0 || BaseTicksPerSecond % i_rTrack.m_Timescale != 0 )
  {
    Teller.TellInexactTimescale();
  }
  if( uint64_t{ i_rTrack.m_SampleCount } * i_rTrack.m_SamplePeriod != i_rTrack.m_MediaDuration )
  {
    Teller.Tell( "%s track (%d) has a duration that does not match total of duration of its samples." );
  }
  CompareDurations( i_rTrack, i_MovieTimescale, Teller );
  return true;
}

uint64_t GetPeriodInBaseTicks( const VTrack& i_rTrack, std::vector<std::string>* o_pMessages )
{
  const bool bKnown = i_rTrack.m_Timescale != 0;
  if( !bKnown || uint64_t{ i_rTrack.m_SamplePeriod } * BaseTicksPerSecond % i_rTrack.m_Timescale != 0 )
  {
    VTeller( i_rTrack, o_pMessages ).TellInexactTimescale();
  }
  return bKnown ? uint64_t{ BaseTicksPerSecond / i_rTrack.m_Timescale } * i_rTrack.m_SamplePeriod : 0;
}

}
