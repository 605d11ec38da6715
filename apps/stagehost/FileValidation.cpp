#include "apps/stagehost/FileValidation.h"

#include "Core/VideoInterface/VideoContainer.h"
#include "FileIO/MovIO/MovFileCheck.h"

#include <boost/algorithm/string/join.hpp>

using StageCorePluginInterface::VCaptureFileReport;

namespace
{

void Validate( VCaptureFileReport& io_rFile )
{
  const bool bMovie = io_rFile.m_Container == KVZ::IVideoContainer::EMOV || io_rFile.m_Container == KVZ::IVideoContainer::EMP4;
  if( !bMovie || io_rFile.m_bFailed )
  {
    return;
  }
  const std::vector<std::string> Faults = MovIO::CheckMovFile( io_rFile.m_Path );
  if( !Faults.empty() )
  {
    io_rFile.m_bFailed = true;
    io_rFile.m_Error = "The file \"" + io_rFile.m_Path + "\" is not right: " + boost::algorithm::join( Faults, " " );
  }
}

}

void ValidateMovies( std::vector<StageHost::VDeviceOutcome>& io_rOutcomes )
{
  for( StageHost::VDeviceOutcome& rOutcome : io_rOutcomes )
  {
    for( VCaptureFileReport& rFile : rOutcome.m_Files )
    {
      Validate( rFile );
    }
  }
}
