// Delivery times of a source with a true rate and a known, repeatable lateness.
#pragma once

#include <cstdint>
#include <random>

constexpr uint32_t TicksPerSecond = 135000000;
constexpr uint32_t Period25 = 5400000;

struct VDeliveryTimes
{
  double m_Start = 1000.0;
  double m_Rate = 0.04;    // seconds per sample
  double m_Jitter = 0.0;   // seconds, lateness is spread evenly over 0 to this
  std::mt19937_64 m_Random{ 7 };

  double operator()( uint64_t i_Sample )
  {
    const double Late = m_Jitter > 0.0 ? std::uniform_real_distribution<double>( 0.0, m_Jitter )( m_Random ) : 0.0;
    return m_Start + static_cast<double>( i_Sample ) * m_Rate + Late;
  }
};
