// Folds a line of the log that repeats: the first is written, those that follow it within a few seconds are counted, and their number goes out
// before the next other line, with the next of their kind after those seconds, and at the end.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <cstdint>
#include <functional>
#include <string>

namespace KVZ::Detail
{
// Any thread.
class VLogRepeats
{
public:
  using VWrite = std::function<void( const VLogRecord& )>;

  // Called with the lock held: lines come out one after another. The clock counts seconds; an empty one stands for the monotonic clock.
  explicit VLogRepeats( VWrite i_Write, std::function<double()> i_Clock = {} );
  ~VLogRepeats();

  void Write( const VLogRecord& i_rRecord );

private:
  bool IsRepeat( const VLogRecord& i_rRecord, double i_Now ) const REQUIRES( m_Mutex );
  void TellRepeats() REQUIRES( m_Mutex );

  const VWrite m_Write;
  const std::function<double()> m_Clock;

  boost::mutex m_Mutex;
  // The line that was written last, and those that it stands for
  std::string m_Category GUARDED_BY( m_Mutex );
  std::string m_Text GUARDED_BY( m_Mutex );
  VLogRecord m_Origin GUARDED_BY( m_Mutex );   // level and position alone
  double m_Until GUARDED_BY( m_Mutex ) = 0.0;
  uint64_t m_Repeats GUARDED_BY( m_Mutex ) = 0;
};
}
