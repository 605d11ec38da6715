// What is measured, one function a subject. Each compares two ways within one run, or measures against a fixed bound.
#pragma once

#include <boost/optional.hpp>

#include <string>
#include <vector>

struct VFigure
{
  std::string m_Name;
  double m_Value = 0.0;
  std::string m_Unit;                // "us", "MiB", "x" for a ratio
  boost::optional<double> m_Bound;   // empty: for information

  bool IsMet() const { return !m_Bound || m_Value <= *m_Bound; }
};

struct VBenchOptions
{
  bool m_bQuick = false;   // fewer rounds: the figures scatter more
  std::string m_Folder;    // where files are written; exists
};

// Throws std::runtime_error where something cannot be measured at all.
std::vector<VFigure> MeasureFramePath( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureFileWriting( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureRecording( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasurePixelConversion( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureMovies( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureImageCompression( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureImageSequence( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureFlow( const VBenchOptions& i_rOptions );
std::vector<VFigure> MeasureOpenGL( const VBenchOptions& i_rOptions );
