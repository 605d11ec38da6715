#include "apps/stagehost/TextTable.h"

#include <algorithm>
#include <array>
#include <cstdio>

namespace
{

// UTF-8: all but a character's first byte.
bool IsContinuation( char i_Byte ) { return ( static_cast<unsigned char>( i_Byte ) & 0xC0 ) == 0x80; }

size_t CountCharacters( const std::string& i_rText )
{
  return i_rText.size() - static_cast<size_t>( std::count_if( i_rText.begin(), i_rText.end(), IsContinuation ) );
}

}

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
      Widths[Column] = std::max( Widths[Column], CountCharacters( rRow[Column] ) );
    }
  }
  std::string Text;
  for( const auto& rRow : m_Rows )
  {
    std::string Line;
    for( size_t Column = 0; Column < rRow.size(); ++Column )
    {
      Line += rRow[Column] + std::string( Widths[Column] - CountCharacters( rRow[Column] ) + 2, ' ' );
    }
    Line.erase( Line.find_last_not_of( ' ' ) + 1 );
    Text += Line + "\n";
  }
  return Text;
}

std::string OneLine( std::string i_Text )
{
  for( size_t Index = 0; Index < i_Text.size(); ++Index )
  {
    const auto Byte = static_cast<unsigned char>( i_Text[Index] );
    const bool bSecondSet = Byte == 0xC2 && Index + 1 < i_Text.size() && static_cast<unsigned char>( i_Text[Index + 1] ) < 0xA0;   // U+0080 to U+009F
    if( bSecondSet )
    {
      i_Text.erase( Index, 1 );
    }
    if( bSecondSet || Byte < 0x20 || Byte == 0x7F )
    {
      i_Text[Index] = ' ';
    }
  }
  return i_Text;
}

std::string Shortened( const std::string& i_rText, size_t i_Characters )
{
  if( CountCharacters( i_rText ) <= i_Characters )
  {
    return i_rText;
  }
  size_t End = 0;
  for( size_t Count = 0; End < i_rText.size() && ( Count + 3 < i_Characters || IsContinuation( i_rText[End] ) ); ++End )
  {
    Count += IsContinuation( i_rText[End] ) ? 0 : 1;
  }
  return i_rText.substr( 0, End ) + "...";
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
