#include "apps/stagehost/TextTable.h"

#include <algorithm>
#include <array>
#include <cstdio>

VTextTable::VTextTable( std::vector<std::string> i_Heads ) : m_Rows{ std::move( i_Heads ) } {}

void VTextTable::AddRow( std::vector<std::string> i_Cells )
{
  i_Cells.resize( m_Rows.front().size() );
  m_Rows.push_back( std::move( i_Cells ) );
}

std::string VTextTable::ToText() const
{
  std::vector<size_t> Widths( m_Rows.front().size() );
  for( const auto& rRow : m_Rows )
  {
    for( size_t Column = 0; Column < rRow.size(); ++Column )
    {
      Widths[Column] = std::max( Widths[Column], rRow[Column].size() );
    }
  }
  std::string Text;
  for( const auto& rRow : m_Rows )
  {
    std::string Line;
    for( size_t Column = 0; Column < rRow.size(); ++Column )
    {
      Line += rRow[Column] + std::string( Widths[Column] - rRow[Column].size() + 2, ' ' );
    }
    Line.erase( Line.find_last_not_of( ' ' ) + 1 );
    Text += Line + "\n";
  }
  return Text;
}

std::string JoinTexts( const std::vector<std::string>& i_rTexts, const std::string& i_rBetween )
{
  std::string Joined;
  for( const std::string& rText : i_rTexts )
  {
    Joined += ( Joined.empty() ? "" : i_rBetween ) + rText;
  }
  return Joined;
}

std::string BytesToText( uint64_t i_Bytes )
{
  constexpr std::array Units = { "B", "kB", "MB", "GB", "TB" };
  double Value = static_cast<double>( i_Bytes );
  size_t Unit = 0;
  for( ; Value >= 1000.0 && Unit + 1 < Units.size(); ++Unit )
  {
    Value /= 1000.0;
  }
  char Text[32];
  std::snprintf( Text, sizeof( Text ), Unit == 0 ? "%.0f %s" : "%.1f %s", Value, Units[Unit] );
  return Text;
}
