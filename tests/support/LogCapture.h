// Collects what goes to the log in one category, or in all, while it lives.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{
struct VLogLine
{
  std::string m_Category;
  int m_Level = 0;
  std::string m_Text;
  std::string m_File;
  int m_Line = 0;
};

// Every operation may be called from any thread.
class VLogCapture
{
public:
  // An empty category means all. Messages up to the level are let through, whatever the sinks want.
  explicit VLogCapture( const std::string& i_Category = "", int i_Level = KVZ::LogLevel::Detail )
    : m_Id( KVZ::AddLogObserver( { [pLines = m_pLines]( const KVZ::VLogRecord& i_rRecord ) { pLines->Add( i_rRecord ); }, i_Level, i_Category } ) )
  {
  }
  ~VLogCapture() { KVZ::RemoveLogObserver( m_Id ); }
  VLogCapture( const VLogCapture& ) = delete;
  VLogCapture& operator=( const VLogCapture& ) = delete;

  std::vector<VLogLine> Lines() const { return m_pLines->Copy(); }

  std::vector<std::string> Texts() const
  {
    std::vector<std::string> Texts;
    for( const VLogLine& rLine : Lines() )
    {
      Texts.push_back( rLine.m_Text );
    }
    return Texts;
  }

  // How many lines have exactly this text.
  size_t Count( const std::string& i_Text ) const
  {
    const auto All = Texts();
    return static_cast<size_t>( std::count( All.begin(), All.end(), i_Text ) );
  }
  bool Has( const std::string& i_Text ) const { return Count( i_Text ) > 0; }

  void Clear() { m_pLines->Clear(); }

private:
  // Shared with the observer, which may still run on another thread when the capture has gone.
  class VLines
  {
  public:
    void Add( const KVZ::VLogRecord& i_rRecord )
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Lines.push_back(
        { std::string( i_rRecord.m_Category ), i_rRecord.m_Level, std::string( i_rRecord.m_Text ), i_rRecord.m_pFile, i_rRecord.m_Line } );
    }
    std::vector<VLogLine> Copy() const
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      return m_Lines;
    }
    void Clear()
    {
      boost::lock_guard<boost::mutex> Lock( m_Mutex );
      m_Lines.clear();
    }

  private:
    mutable boost::mutex m_Mutex;
    std::vector<VLogLine> m_Lines GUARDED_BY( m_Mutex );
  };

  const std::shared_ptr<VLines> m_pLines = std::make_shared<VLines>();
  const uint64_t m_Id;
};
}
