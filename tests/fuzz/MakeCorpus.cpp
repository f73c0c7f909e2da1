// Writes the files from which the fuzzers start: one of each kind that the readers tell apart.

#include <C3dWriter.h>

#include <filesystem>
#include <fstream>
#include <iostream>

namespace
{
using C3dWriter::EForm;
using C3dWriter::VFile;

void Save( const std::filesystem::path& i_rPath, const char* i_pBytes, std::size_t i_Size )
{
  std::filesystem::create_directories( i_rPath.parent_path() );
  std::ofstream( i_rPath, std::ios::binary ).write( i_pBytes, static_cast< std::streamsize >( i_Size ) );
}

VFile Points( EForm i_Form, bool i_bFloat )
{
  VFile File;
  File.Form = i_Form;
  File.bFloat = i_bFloat;
  File.Points = 3;
  File.Labels = { "A", "A", "*3" };
  File.Frames.assign( 4, { 1, 2, 3, 257, 4, 5, 6, -1, 7, 8, 9, 0 } );
  File.SetParameter( { "POINT", "DESCRIPTIONS", -1, { 3, 3 }, {}, { "one", "two", "   " } } );
  File.SetParameter( { "POINT", "X_SCREEN", -1, { 2 }, {}, { "+X" } } );
  File.SetParameter( { "POINT", "Y_SCREEN", -1, { 2 }, {}, { "+Z" } } );
  return File;
}

VFile Plate( double i_Type )
{
  VFile File;
  const std::size_t Channels = i_Type == 3 ? 8 : 6;
  File.bFloat = i_Type != 1;
  File.Channels = Channels;
  File.PerFrame = 2;
  File.Frames.assign( 5, std::vector< double >( 2 * Channels, -50 ) );
  std::vector< double > Numbers, Matrix( 36, 1 );
  for ( std::size_t Index = 1; Index <= Channels; ++Index )
  {
    Numbers.push_back( static_cast< double >( Index ) );
  }
  const auto Count = static_cast< std::uint8_t >( Channels );
  File.SetParameter( { "FORCE_PLATFORM", "USED", 2, {}, { 1 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "TYPE", 2, { 1 }, { i_Type }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "ZERO", 2, { 2 }, { 1, 2 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CORNERS", 4, { 3, 4, 1 }, { 1, 1, 0, 1, 0, 0, 0, 0, 0, 0, 1, 0 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "ORIGIN", 4, { 3, 1 }, { 1, 2, -40 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CHANNEL", 2, { Count, 1 }, Numbers, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CAL_MATRIX", 4, { 6, 6, 1 }, Matrix, {} } );
  File.SetParameter( { "ANALOG", "SCALE", 4, { Count }, std::vector< double >( Channels, 0.5 ), {} } );
  File.SetParameter( { "ANALOG", "OFFSET", 2, { Count }, std::vector< double >( Channels, 1 ), {} } );
  File.SetParameter( { "ANALOG", "FORMAT", -1, { 8 }, {}, { "UNSIGNED" } } );
  File.SetParameter( { "ANALOG", "UNITS", -1, { 2, Count }, {}, std::vector< std::string >( Channels, "Nm" ) } );
  return File;
}

void SaveC3d( const std::filesystem::path& i_rFolder )
{
  const auto Write = [&]( const std::string& i_rName, const VFile& i_rFile )
  {
    const auto Bytes = C3dWriter::Write( i_rFile );
    Save( i_rFolder / i_rName, reinterpret_cast< const char* >( Bytes.data() ), Bytes.size() );
  };
  const std::pair< const char*, EForm > Forms[] = {
      { "intel", EForm::Intel }, { "dec", EForm::Dec }, { "mips", EForm::Mips } };
  for ( const auto& [Name, Form] : Forms )
  {
    Write( std::string( Name ) + "-float.c3d", Points( Form, true ) );
    Write( std::string( Name ) + "-integer.c3d", Points( Form, false ) );
  }
  for ( int Type = 1; Type <= 4; ++Type )
  {
    Write( "plate-type" + std::to_string( Type ) + ".c3d", Plate( Type ) );
  }
  VFile Events = Points( EForm::Intel, true );
  Events.HeaderEvents = { { "LHS", 0.5 } };
  Write( "header-events.c3d", Events );
  Events.SetParameter( { "EVENT", "USED", 2, {}, { 1 }, {} } );
  Events.SetParameter( { "EVENT", "LABELS", -1, { 2, 1 }, {}, { "FS" } } );
  Events.SetParameter( { "EVENT", "CONTEXTS", -1, { 4, 1 }, {}, { "Left" } } );
  Events.SetParameter( { "EVENT", "TIMES", 4, { 2, 1 }, { 0, 0.1 }, {} } );
  Write( "group-events.c3d", Events );
  VFile Long = Points( EForm::Intel, false );
  Long.HeaderLast = 65535;
  Long.SetParameter( { "POINT", "LONG_FRAMES", 4, {}, { 70000 }, {} } );
  Write( "long-frames.c3d", Long );
  Long.SetParameter( { "TRIAL", "ACTUAL_START_FIELD", 2, { 2 }, { 1, 1 }, {} } );
  Long.SetParameter( { "TRIAL", "ACTUAL_END_FIELD", 2, { 2 }, { 9, 1 }, {} } );
  Write( "trial-fields.c3d", Long );
}

void SaveTrc( const std::filesystem::path& i_rFolder )
{
  const auto Write = [&]( const std::string& i_rName, const std::string& i_rText )
  {
    Save( i_rFolder / i_rName, i_rText.data(), i_rText.size() );
  };
  const std::string Head = "PathFileType\t4\t(X/Y/Z)\ta.trc\nDataRate\tNumFrames\tNumMarkers\tUnits\n";
  const std::string Names = "Frame#\tTime\tA\t\t\tB\t\t\n\t\tX1\tY1\tZ1\n";
  const std::string Rows = "1\t0.0\t1\t2\t3\t4\t5\t6\n2\t0.1\t1.5\t-2e1\t+3\n";
  Write( "plain.trc", Head + "50\t2\t2\tmm\n" + Names + Rows );
  Write( "metres.trc", Head + "60.0\t   2\t2\tm\n" + Names + "\n" + Rows );
  Write( "unlabelled.trc", Head + "50\t2\t0\tmm\nFrame# \tTime\n\t\t\n\n1\t0\t1\t2\t3\t4\t5\t6\n2\t0.1\t7\t8\t9\n" );
  Write( "gaps.trc", Head + "50\t3\t2\tcm\n" + Names + "1\t0\t\t\t\t4\t5\t6\n2\n3\t0.2\t1\t\t3\n" );
  Write( "repeats.trc", Head + "50\t1\t3\tmm\nFrame#\tTime\tA\tA\tA_1\nX1\n1\t0\t1\t2\t3\t1\t2\t3\t1\t2\t3\n" );
  Write( "no-numbers.trc", Head + "50\t1\t2\tmm\n" + Names + "1\t0\tnan\tinf\t1e999\t-inf\t1e-999\t0x1\n" );
  Write( "cut.trc", Head + "50\t9\t2\tmm\n" + Names + Rows + "3\t0.2\t1.2" );
  Write( "crlf.trc", "PathFileType\r\nDataRate\r\n50\r\nFrame#\tTime\tA\r\n\r\n\r\n1\t0\t1\t2\t3\r\n" );
  Write( "mark.trc", "\xEF\xBB\xBFPathFileType\nDataRate\n50\nFrame#\tTime\n\n-1\n" );
  Write( "header-only.trc", Head );
}
} // namespace

int main( int i_Count, char** i_ppArguments )
{
  if ( i_Count != 2 )
  {
    std::cerr << "usage: make_fuzz_corpus FOLDER\n";
    return 2;
  }
  SaveC3d( std::filesystem::path( i_ppArguments[1] ) / "c3d" );
  SaveTrc( std::filesystem::path( i_ppArguments[1] ) / "trc" );
  return 0;
}
