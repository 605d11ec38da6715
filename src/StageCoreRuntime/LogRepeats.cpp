#include "StageCoreRuntime/LogRepeats.h"

#include <boost/thread/lock_guard.hpp>

#include <chrono>
#include <utility>

namespace KVZ::Detail
{
namespace
{
constexpr double FoldSeconds = 5.0;

double MonotonicSeconds() { return std::chrono::duration<double>( std::chrono::steady_clock::now().time_since_epoch() ).count(); }
}

VLogRepeats::VLogRepeats( VWrite i_Write, std::function<double()> i_Clock )
  : m_Write( std::move( i_Write ) ), m_Clock( i_Clock ? std::move( i_Clock ) : MonotonicSeconds )
{
}

VLogRepeats::~VLogRepeats()
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  TellRepeats();
}

void VLogRepeats::Write( const VLogRecord& i_rRecord )
{
  const double Now = m_Clock();
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  if( IsRepeat( i_rRecord, Now ) )
  {
    ++m_Repeats;
    return;
  }
  TellRepeats();
  m_Category = i_rRecord.m_Category;
  m_Text = i_rRecord.m_Text;
  m_Origin = { {}, i_rRecord.m_Level, {}, i_rRecord.m_pFile, i_rRecord.m_Line };
  m_Until = Now + FoldSeconds;
  m_Write( i_rRecord );
}

bool VLogRepeats::IsRepeat( const VLogRecord& i_rRecord, double i_Now ) const
{
  return i_Now < m_Until && i_rRecord.m_Text == m_Text && i_rRecord.m_Category == m_Category && i_rRecord.m_Level == m_Origin.m_Level;
}

void VLogRepeats::TellRepeats()
{
  if( m_Repeats == 0 )
  {
    return;
  }
  VLogRecord Note = m_Origin;
  const std::string Text = m_Text + " (repeated " + std::to_string( m_Repeats ) + " times)";
  Note.m_Category = m_Category;
  Note.m_Text = Text;
  m_Repeats = 0;
  m_Write( Note );
}
}
