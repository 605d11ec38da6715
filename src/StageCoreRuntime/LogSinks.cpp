#include "StageCoreRuntime/LogSinks.h"

#include "StageCoreRuntime/LogRepeats.h"

#include <spdlog/sinks/rotating_file_sink.h>
#include <spdlog/sinks/stdout_color_sinks.h>

namespace KVZ::Detail
{
namespace
{
constexpr const char* ConsolePattern = "%H:%M:%S.%e %^[%n:%l]%$ %v";
constexpr const char* FilePattern = "%Y-%m-%d %H:%M:%S.%e %t [%n:%l] %v (%s:%#)";

spdlog::level::level_enum SpdlogLevel( int i_Level )
{
  if( i_Level <= LogLevel::Error )
  {
    return spdlog::level::err;
  }
  if( i_Level <= LogLevel::Warning )
  {
    return spdlog::level::warn;
  }
  return i_Level <= LogLevel::Information ? spdlog::level::info : spdlog::level::debug;
}

// A sink that fails (a full disk, a closed console) must not take the caller down with it, and has nowhere to say so.
void WriteTo( spdlog::sinks::sink& i_rSink, const VLogRecord& i_rRecord )
{
  try
  {
    const spdlog::source_loc Position( i_rRecord.m_pFile, i_rRecord.m_Line, "" );
    const spdlog::string_view_t Category( i_rRecord.m_Category.data(), i_rRecord.m_Category.size() );
    const spdlog::string_view_t Text( i_rRecord.m_Text.data(), i_rRecord.m_Text.size() );
    i_rSink.log( spdlog::details::log_msg( Position, Category, SpdlogLevel( i_rRecord.m_Level ), Text ) );
    if( i_rRecord.m_Level <= LogLevel::Warning )
    {
      i_rSink.flush();
    }
  }
  catch( const std::exception& )
  {
  }
}
}

struct VLogSinks::VImpl
{
  spdlog::sinks::stderr_color_sink_mt m_Console;
  std::unique_ptr<spdlog::sinks::rotating_file_sink_mt> m_pFile;
  std::string m_FileFailure;
  VLogRepeats m_ToConsole{ [this]( const VLogRecord& i_rRecord ) { WriteTo( m_Console, i_rRecord ); } };
  VLogRepeats m_ToFile{ [this]( const VLogRecord& i_rRecord ) { WriteTo( *m_pFile, i_rRecord ); } };
};

VLogSinks::VLogSinks( const VLogOptions& i_rOptions ) : m_pImpl( std::make_unique<VImpl>() )
{
  m_pImpl->m_Console.set_pattern( ConsolePattern );
  if( i_rOptions.m_FilePath.empty() )
  {
    return;
  }
  try
  {
    m_pImpl->m_pFile = std::make_unique<spdlog::sinks::rotating_file_sink_mt>( i_rOptions.m_FilePath, i_rOptions.m_FileBytes,
      i_rOptions.m_FileCount );
    m_pImpl->m_pFile->set_pattern( FilePattern );
  }
  catch( const std::exception& i_rException )
  {
    m_pImpl->m_FileFailure = i_rException.what();
  }
}

VLogSinks::~VLogSinks() = default;

bool VLogSinks::HasFile() const { return m_pImpl->m_pFile != nullptr; }

const std::string& VLogSinks::FileFailure() const { return m_pImpl->m_FileFailure; }

void VLogSinks::WriteToConsole( const VLogRecord& i_rRecord ) { m_pImpl->m_ToConsole.Write( i_rRecord ); }

void VLogSinks::WriteToFile( const VLogRecord& i_rRecord )
{
  if( m_pImpl->m_pFile )
  {
    m_pImpl->m_ToFile.Write( i_rRecord );
  }
}
}
