// Clocks name timelines; ITickInClocks tells what each of them read at one moment. Plain values.
#pragma once

#include "SyncSystem/Tick.h"

#include <boost/container/flat_map.hpp>
#include <boost/container/small_vector.hpp>

#include <cstdint>
#include <functional>
#include <tuple>
#include <utility>

namespace KVZ
{

class IClock
{
public:
  enum EType : int32_t
  {
    GlobalTime = 0,
    Timecode = 1,
    FrameNumber = 3,
    CounterFromSessionStart = 4
  };

  constexpr IClock() = default;
  constexpr IClock( EType i_Type, int32_t i_Index, uint64_t i_Source ) : m_Type( i_Type ), m_Index( i_Index ), m_Source( i_Source ) {}

  constexpr EType Type() const { return m_Type; }
  // For a Timecode clock the timecode standard plus 1, otherwise 0.
  constexpr int32_t Index() const { return m_Index; }
  // The source that the clock belongs to; 0 for a clock that sources share.
  constexpr uint64_t Source() const { return m_Source; }

  // By type, then source, then index: a source's map ends with its counter.
  constexpr bool operator<( const IClock& i_rOther ) const
  {
    return std::tie( m_Type, m_Source, m_Index ) < std::tie( i_rOther.m_Type, i_rOther.m_Source, i_rOther.m_Index );
  }
  constexpr bool operator==( const IClock& ) const = default;

private:
  EType m_Type = GlobalTime;
  int32_t m_Index = 0;
  uint64_t m_Source = 0;
};

// For log text; "InvalidClockType" for a value without a name.
const char* ClockName( IClock::EType i_Type );

struct ITickInClocks
{
  // A frame has at most three clocks, so its map lives without the heap.
  using VMap = boost::container::flat_map<IClock, VTick, std::less<IClock>, boost::container::small_vector<std::pair<IClock, VTick>, 4>>;

  VMap m_TickByClock;

  // The invalid tick for an absent clock.
  VTick Find( const IClock& i_rClock ) const
  {
    const auto Found = m_TickByClock.find( i_rClock );
    return Found == m_TickByClock.end() ? VTick::Invalid() : Found->second;
  }
  // Replaces what is there.
  void Set( const IClock& i_rClock, VTick i_Tick ) { m_TickByClock.insert_or_assign( i_rClock, i_Tick ); }
  bool IsEmpty() const { return m_TickByClock.empty(); }
  bool operator==( const ITickInClocks& i_rOther ) const { return m_TickByClock == i_rOther.m_TickByClock; }
};

// Every reading moved by the same span.
ITickInClocks Shifted( const ITickInClocks& i_rTicks, VTick i_By );

}
