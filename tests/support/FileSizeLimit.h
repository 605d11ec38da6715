// Lets the process write files no longer than this while it lives, as a disk that fills up would.
#pragma once

#include <csignal>
#include <cstdint>

#include <sys/resource.h>

namespace TestSupport
{

class VFileSizeLimit
{
public:
  explicit VFileSizeLimit( uint64_t i_Bytes ) : m_pHandler( std::signal( SIGXFSZ, SIG_IGN ) )
  {
    getrlimit( RLIMIT_FSIZE, &m_Before );
    const rlimit Limit{ i_Bytes, m_Before.rlim_max };
    setrlimit( RLIMIT_FSIZE, &Limit );
  }
  ~VFileSizeLimit()
  {
    setrlimit( RLIMIT_FSIZE, &m_Before );
    std::signal( SIGXFSZ, m_pHandler );
  }
  VFileSizeLimit( const VFileSizeLimit& ) = delete;
  VFileSizeLimit& operator=( const VFileSizeLimit& ) = delete;

private:
  rlimit m_Before{};
  void ( *const m_pHandler )( int );
};

}
