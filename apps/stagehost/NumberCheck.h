// Checks numbers of the command line in words that a person can act on.
#pragma once

#include <CLI/CLI.hpp>

#include <cmath>
#include <cstdlib>
#include <string>

enum class ELowerEnd
{
  Included,
  Excluded
};

// A number between the two; "nan" and "inf" are none.
inline CLI::Validator NumberCheck( double i_Least, double i_Most, const std::string& i_rAccepted, ELowerEnd i_LowerEnd = ELowerEnd::Included )
{
  const auto Check = [=]( const std::string& i_rText )
  {
    char* pEnd = nullptr;
    const double Number = std::strtod( i_rText.c_str(), &pEnd );
    const bool bNumber = !i_rText.empty() && *pEnd == '\0' && std::isfinite( Number );
    const bool bAboveLeast = i_LowerEnd == ELowerEnd::Included ? Number >= i_Least : Number > i_Least;
    return bNumber && bAboveLeast && Number <= i_Most ? std::string() : "\"" + i_rText + "\" is not accepted; accepted: " + i_rAccepted;
  };
  return CLI::Validator( Check, "", "" );
}

inline CLI::Validator WholeNumberCheck( double i_Least, double i_Most, const std::string& i_rAccepted )
{
  const CLI::Validator Range = NumberCheck( i_Least, i_Most, i_rAccepted );
  const auto Check = [=]( std::string& i_rText )
  {
    const bool bDigits = !i_rText.empty() && i_rText.find_first_not_of( "0123456789" ) == std::string::npos;
    return bDigits ? Range( i_rText ) : "\"" + i_rText + "\" is not accepted; accepted: " + i_rAccepted;
  };
  return CLI::Validator( Check, "", "" );
}

// How long something runs: up to days, so that times in ticks stay far from their ends.
inline CLI::Validator SecondsCheck() { return NumberCheck( 0.0, 1e6, "seconds above 0, up to 1000000", ELowerEnd::Excluded ); }
