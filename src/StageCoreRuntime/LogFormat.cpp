#include "StageCoreRuntime/GlobalLog.h"

#include <boost/format.hpp>

#include <locale>

namespace KVZ
{
std::string FormatLogMessage( std::string_view i_Format, const VLogArgument* i_pArguments, size_t i_Count )
{
  try
  {
    boost::format Format( std::string( i_Format ), std::locale::classic() );
    for( size_t Index = 0; Index < i_Count; ++Index )
    {
      std::visit( [&Format]( const auto& i_rValue ) { Format % i_rValue; }, i_pArguments[Index].Value() );
    }
    return Format.str();
  }
  catch( const std::exception& )
  {
    return "Cannot Format Log Message \"" + std::string( i_Format ) + "\"";
  }
}
}
