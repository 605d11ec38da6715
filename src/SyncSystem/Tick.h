// A point or a span on the 135 MHz timeline that all sources share. Plain value.
#pragma once

#include <compare>
#include <cstdint>
#include <limits>

namespace KVZ
{

template<int64_t TicksPerSecondValue>
class ITick
{
public:
  static constexpr int64_t TicksPerSecond = TicksPerSecondValue;

  constexpr ITick() = default;
  constexpr explicit ITick( int64_t i_Count ) : m_Count( i_Count ) {}

  // The lowest number: what a look-up of an absent clock gives.
  static constexpr ITick Invalid() { return ITick( std::numeric_limits<int64_t>::min() ); }
  // The highest number: a time that is not known yet, an open end, or "now" where a request allows it.
  static constexpr ITick Open() { return ITick( std::numeric_limits<int64_t>::max() ); }
  // Rounded half away from zero.
  static constexpr ITick FromSeconds( double i_Seconds )
  {
    return ITick( static_cast<int64_t>( i_Seconds * static_cast<double>( TicksPerSecond ) + ( i_Seconds < 0.0 ? -0.5 : 0.5 ) ) );
  }

  constexpr int64_t Count() const { return m_Count; }
  constexpr bool IsValid() const { return *this != Invalid(); }
  constexpr bool IsOpen() const { return *this == Open(); }
  constexpr double Seconds() const { return static_cast<double>( m_Count ) / static_cast<double>( TicksPerSecond ); }

  constexpr auto operator<=>( const ITick& ) const = default;
  constexpr ITick operator-() const { return ITick( -m_Count ); }
  constexpr ITick operator+( ITick i_Other ) const { return ITick( m_Count + i_Other.m_Count ); }
  constexpr ITick operator-( ITick i_Other ) const { return ITick( m_Count - i_Other.m_Count ); }
  constexpr ITick operator*( int64_t i_Factor ) const { return ITick( m_Count * i_Factor ); }
  constexpr ITick& operator+=( ITick i_Other )
  {
    m_Count += i_Other.m_Count;
    return *this;
  }
  constexpr ITick& operator-=( ITick i_Other )
  {
    m_Count -= i_Other.m_Count;
    return *this;
  }

private:
  int64_t m_Count = 0;
};

using VTick = ITick<135000000>;

constexpr VTick SecondsToTick135( int64_t i_Seconds ) { return VTick( i_Seconds * VTick::TicksPerSecond ); }
constexpr VTick MillisecondsToTick135( int64_t i_Milliseconds ) { return VTick( i_Milliseconds * ( VTick::TicksPerSecond / 1000 ) ); }

}
