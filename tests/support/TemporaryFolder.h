// A folder of its own that goes with all it holds.
#pragma once

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <string>

namespace TestSupport
{

class VTemporaryFolder
{
public:
  VTemporaryFolder() : m_Path( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "stagecore-%%%%-%%%%-%%%%" ) )
  {
    boost::filesystem::create_directories( m_Path );
  }
  ~VTemporaryFolder()
  {
    boost::system::error_code Error;
    boost::filesystem::remove_all( m_Path, Error );
  }
  VTemporaryFolder( const VTemporaryFolder& ) = delete;
  VTemporaryFolder& operator=( const VTemporaryFolder& ) = delete;

  std::string File( const std::string& i_rName ) const { return ( m_Path / i_rName ).string(); }

private:
  const boost::filesystem::path m_Path;
};

}
