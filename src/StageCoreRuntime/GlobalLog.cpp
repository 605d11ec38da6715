#include "StageCoreRuntime/GlobalLog.h"

#include "StageCoreRuntime/LogSinks.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <vector>

namespace KVZ
{
namespace
{
// Everything that decides where a record goes. Replaced on change, never changed, so a record is handed out without a lock.
struct VRouting
{
  VLogOptions m_Options;
  std::shared_ptr<Detail::VLogSinks> m_pSinks;
  std::vector<std::pair<uint64_t, VLogObserver>> m_Observers;

  int LevelFor( const std::string& i_Category, int i_DefaultLevel ) const
  {
    const auto Found = m_Options.m_CategoryLevels.find( i_Category );
    return Found == m_Options.m_CategoryLevels.end() ? i_DefaultLevel : Found->second;
  }

  int ConsoleLevel( const std::string& i_Category ) const { return LevelFor( i_Category, m_Options.m_ConsoleLevel ); }

  int FileLevel( const std::string& i_Category ) const
  {
    return m_pSinks->HasFile() ? LevelFor( i_Category, m_Options.m_FileLevel ) : static_cast<int>( LogLevel::None );
  }

  int HighestLevel( const std::string& i_Category ) const
  {
    int Level = std::max( ConsoleLevel( i_Category ), FileLevel( i_Category ) );
    for( const auto& [Id, rObserver] : m_Observers )
    {
      if( Wants( rObserver, i_Category ) )
      {
        Level = std::max( Level, rObserver.m_Level );
      }
    }
    return Level;
  }

  static bool Wants( const VLogObserver& i_rObserver, const std::string& i_Category )
  {
    return i_rObserver.m_Category.empty() || i_rObserver.m_Category == i_Category;
  }
};

class VGlobalLog : public ILogCategorised
{
public:
  VGlobalLog()
  {
    auto pRouting = std::make_shared<VRouting>();
    pRouting->m_pSinks = std::make_shared<Detail::VLogSinks>( pRouting->m_Options );
    m_pRouting = pRouting;
  }

  const VLogCategory& Category( std::string_view i_Name ) override
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto Found = m_Categories.find( i_Name );
    if( Found != m_Categories.end() )
    {
      return Found->second;
    }
    const auto Added = m_Categories.try_emplace( std::string( i_Name ), std::string( i_Name ) ).first;
    Added->second.SetLevel( m_pRouting->HighestLevel( Added->first ) );
    return Added->second;
  }

  void Write( const VLogCategory& i_rCategory, int i_Level, const char* i_pFile, int i_Line, std::string_view i_Text ) override
  {
    const std::shared_ptr<const VRouting> pRouting = Routing();
    const std::string& rName = i_rCategory.Name();
    const VLogRecord Record{ rName, i_Level, i_Text, i_pFile, i_Line };
    if( i_Level <= pRouting->ConsoleLevel( rName ) )
    {
      pRouting->m_pSinks->WriteToConsole( Record );
    }
    if( i_Level <= pRouting->FileLevel( rName ) )
    {
      pRouting->m_pSinks->WriteToFile( Record );
    }
    for( const auto& [Id, rObserver] : pRouting->m_Observers )
    {
      if( i_Level <= rObserver.m_Level && VRouting::Wants( rObserver, rName ) )
      {
        rObserver.m_Function( Record );
      }
    }
  }

  bool Configure( const VLogOptions& i_rOptions )
  {
    const auto pSinks = std::make_shared<Detail::VLogSinks>( i_rOptions );
    Change(
      [&]( VRouting& i_rRouting )
      {
        i_rRouting.m_Options = i_rOptions;
        i_rRouting.m_pSinks = pSinks;
      } );
    if( !pSinks->FileFailure().empty() )
    {
      KVZ_LOG( "GlobalLog", LogLevel::Error, "The log file cannot be opened: %1%", pSinks->FileFailure() );
    }
    return pSinks->FileFailure().empty();
  }

  uint64_t AddObserver( VLogObserver i_Observer )
  {
    uint64_t Id = 0;
    Change(
      [&]( VRouting& i_rRouting )
      {
        Id = ++m_LastObserverId;
        i_rRouting.m_Observers.emplace_back( Id, std::move( i_Observer ) );
      } );
    return Id;
  }

  void RemoveObserver( uint64_t i_Id )
  {
    Change( [&]( VRouting& i_rRouting )
      { std::erase_if( i_rRouting.m_Observers, [i_Id]( const auto& i_rObserver ) { return i_rObserver.first == i_Id; } ); } );
  }

private:
  std::shared_ptr<const VRouting> Routing()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return m_pRouting;
  }

  // Replaces the routing by a changed copy and tells every category. The former one ends without the lock.
  template<class TChange>
  void Change( const TChange& i_rChange )
  {
    std::shared_ptr<const VRouting> pFormer;
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    const auto pRouting = std::make_shared<VRouting>( *m_pRouting );
    i_rChange( *pRouting );
    pFormer = std::exchange( m_pRouting, pRouting );
    for( auto& [Name, rCategory] : m_Categories )
    {
      rCategory.SetLevel( pRouting->HighestLevel( Name ) );
    }
  }

  boost::mutex m_Mutex;
  std::map<std::string, VLogCategory, std::less<>> m_Categories GUARDED_BY( m_Mutex );   // grows only
  std::shared_ptr<const VRouting> m_pRouting GUARDED_BY( m_Mutex );
  std::atomic<uint64_t> m_LastObserverId{ 0 };
};

// Never destroyed: static objects of other modules may still log while they end.
VGlobalLog& Instance()
{
  static VGlobalLog* const s_pLog = new VGlobalLog;
  return *s_pLog;
}
}

ILogCategorised& GlobalLog() { return Instance(); }

bool ConfigureLog( const VLogOptions& i_rOptions ) { return Instance().Configure( i_rOptions ); }

uint64_t AddLogObserver( VLogObserver i_Observer ) { return Instance().AddObserver( std::move( i_Observer ) ); }

void RemoveLogObserver( uint64_t i_Id ) { Instance().RemoveObserver( i_Id ); }

namespace Detail
{
void WriteLog( const VLogCategory& i_rCategory, const VLogOrigin& i_rOrigin, std::string_view i_Format, const VLogArgument* i_pArguments,
  size_t i_Count )
{
  const std::string Text = FormatLogMessage( i_Format, i_pArguments, i_Count );
  GlobalLog().Write( i_rCategory, i_rOrigin.m_Level, i_rOrigin.m_pFile, i_rOrigin.m_Line, Text );
}
}
}
