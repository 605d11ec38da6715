// The cells of the five fonts and the characters they hold: what the generator draws and what the text is drawn from.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace CoreVideoUtils
{

struct VFontCell
{
  uint32_t m_Width;
  uint32_t m_Height;

  constexpr size_t Bytes() const { return size_t{ m_Width } * m_Height; }
};

inline constexpr std::array FontCells = { VFontCell{ 12, 20 }, VFontCell{ 19, 32 }, VFontCell{ 28, 48 }, VFontCell{ 38, 64 }, VFontCell{ 43, 72 } };
constexpr char FirstFontCharacter = ' ';
constexpr char LastFontCharacter = '~';
constexpr size_t FontCharacters = LastFontCharacter - FirstFontCharacter + 1;

}
