#include "CoreVideoUtils/BurnInText.h"
#include "StageCoreRuntime/GlobalLog.h"

// The generator's file as it stands.
__asm__( ".pushsection .rodata\n"
         ".globl StageCoreBurnInFonts\n"
         ".hidden StageCoreBurnInFonts\n"
         ".type StageCoreBurnInFonts, @object\n"
         "StageCoreBurnInFonts:\n"
         ".incbin \"" STAGECORE_BURN_IN_FONTS "\"\n"
         ".size StageCoreBurnInFonts, . - StageCoreBurnInFonts\n"
         ".popsection\n" );
extern "C" __attribute__( ( visibility( "hidden" ) ) ) const uint8_t StageCoreBurnInFonts[];

namespace CoreVideoUtils
{

namespace
{

uint32_t KnownIndex( uint32_t i_SizeIndex )
{
  if( i_SizeIndex < FontCells.size() )
  {
    return i_SizeIndex;
  }
  KVZ_LOG_ERROR( "CoreVideoUtils", "Unsupported burn in text size." );
  return DefaultBurnInFont;
}

}

VBurnInFont::VBurnInFont( uint32_t i_SizeIndex )
{
  const uint32_t Index = KnownIndex( i_SizeIndex );
  m_Cell = FontCells[Index];
  m_pBitmap = StageCoreBurnInFonts;
  for( uint32_t Before = 0; Before < Index; ++Before )
  {
    m_pBitmap += FontCells[Before].Bytes() * FontCharacters;
  }
}

const uint8_t* VBurnInFont::Glyph( char i_Character ) const
{
  const bool bKnown = i_Character >= FirstFontCharacter && i_Character <= LastFontCharacter;
  return m_pBitmap + static_cast<size_t>( ( bKnown ? i_Character : '?' ) - FirstFontCharacter ) * m_Cell.Bytes();
}

}
