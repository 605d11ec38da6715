#include "SyncSystem/DriftMonitorSourceTimingInfo.h"

#include <algorithm>
#include <functional>

namespace SyncSystem
{

namespace
{

constexpr size_t RecentMaximumRank = 20;   // one late sample in thirty does not move it

}

VDeliveryStatistics ComputeDeliveryStatistics( std::vector<double> i_Offsets )
{
  if( i_Offsets.empty() )
  {
    return {};
  }
  const double Count = static_cast<double>( i_Offsets.size() );
  double Sum = 0.0;
  double SumOfSquares = 0.0;
  for( const double Offset : i_Offsets )
  {
    Sum += Offset;
    SumOfSquares += Offset * Offset;
  }
  VDeliveryStatistics Statistics;
  Statistics.m_Mean = Sum / Count;
  if( i_Offsets.size() > 1 )
  {
    const double Variance = ( SumOfSquares / Count - Statistics.m_Mean * Statistics.m_Mean ) * Count / ( Count - 1.0 );
    Statistics.m_Variance = std::max( Variance, 0.0 );
  }
  const size_t Rank = i_Offsets.size() < RecentMaximumRank ? 0 : RecentMaximumRank - 1;
  std::nth_element( i_Offsets.begin(), i_Offsets.begin() + static_cast<ptrdiff_t>( Rank ), i_Offsets.end(), std::greater<>() );
  Statistics.m_RecentMaximum = i_Offsets[Rank];
  return Statistics;
}

}
