#include "SyncSystem/Clock.h"

namespace KVZ
{

const char* ClockName( IClock::EType i_Type )
{
  switch( i_Type )
  {
    case IClock::GlobalTime: return "GlobalTime";
    case IClock::Timecode: return "Timecode";
    case IClock::FrameNumber: return "FrameNumber";
    case IClock::CounterFromSessionStart: return "CounterFromSessionStart";
  }
  return "InvalidClockType";
}

ITickInClocks Shifted( const ITickInClocks& i_rTicks, VTick i_By )
{
  ITickInClocks Result = i_rTicks;
  for( auto& [Clock, Tick] : Result.m_TickByClock ) Tick += i_By;
  return Result;
}

}
