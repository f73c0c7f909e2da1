#include <TestSupport/Golden.h>
#include <TestSupport/Paths.h>

#include <QtGui/QImage>

#include <algorithm>
#include <cstdlib>

namespace TestSupport
{
namespace
{
std::filesystem::path KeptPath( const std::string& i_rName )
{
  return SourceDir() / "tests" / "golden" / ( i_rName + ".png" );
}

std::filesystem::path LeftPath( const std::string& i_rName, const char* i_pWhat )
{
  const std::filesystem::path Folder = BinaryDir() / "golden";
  std::filesystem::create_directories( Folder );
  return Folder / ( i_rName + i_pWhat + ".png" );
}

bool IsUpdating()
{
  const char* const pValue = std::getenv( "HARROW_UPDATE_GOLDEN" );
  return pValue && *pValue == '1';
}

bool Save( const QImage& i_rImage, const std::filesystem::path& i_rPath )
{
  return i_rImage.save( QString::fromStdString( i_rPath.string() ), "PNG" );
}

QRgb Apart( QRgb i_A, QRgb i_B )
{
  return qRgb( std::abs( qRed( i_A ) - qRed( i_B ) ), std::abs( qGreen( i_A ) - qGreen( i_B ) ),
               std::abs( qBlue( i_A ) - qBlue( i_B ) ) );
}

std::string Text( QRgb i_Colour )
{
  return QString::asprintf( "(%d, %d, %d)", qRed( i_Colour ), qGreen( i_Colour ), qBlue( i_Colour ) ).toStdString();
}
} // namespace

testing::AssertionResult SamePicture( const QImage& i_rSeen, const QImage& i_rKept,
                                      const VGoldenTolerance& i_rTolerance, QImage* o_pDifference )
{
  if ( i_rSeen.size() != i_rKept.size() )
  {
    return testing::AssertionFailure() << "it is " << i_rSeen.width() << " by " << i_rSeen.height() << ", kept is "
                                       << i_rKept.width() << " by " << i_rKept.height();
  }
  QImage Differences( i_rSeen.size(), QImage::Format_RGB32 );
  QRect Area;
  QPoint Worst;
  int Largest = 0;
  int Count = 0;
  for ( int Y = 0; Y < i_rSeen.height(); ++Y )
  {
    for ( int X = 0; X < i_rSeen.width(); ++X )
    {
      const QRgb Difference = Apart( i_rSeen.pixel( X, Y ), i_rKept.pixel( X, Y ) );
      const int Distance = std::max( { qRed( Difference ), qGreen( Difference ), qBlue( Difference ) } );
      Differences.setPixel( X, Y,
                            qRgb( std::min( qRed( Difference ) * 8, 255 ), std::min( qGreen( Difference ) * 8, 255 ),
                                  std::min( qBlue( Difference ) * 8, 255 ) ) );
      if ( Distance > i_rTolerance.Channel )
      {
        ++Count;
        Area |= QRect( X, Y, 1, 1 );
      }
      if ( Distance > Largest )
      {
        Largest = Distance;
        Worst = { X, Y };
      }
    }
  }
  if ( o_pDifference )
  {
    *o_pDifference = Differences;
  }
  if ( Count <= i_rTolerance.Share * i_rSeen.width() * i_rSeen.height() )
  {
    return testing::AssertionSuccess();
  }
  return testing::AssertionFailure() << Count << " pixels are others, all in x " << Area.left() << " to "
                                     << Area.right() << ", y " << Area.top() << " to " << Area.bottom()
                                     << "; the worst at (" << Worst.x() << ", " << Worst.y() << ") is "
                                     << Text( i_rSeen.pixel( Worst ) ) << ", kept is "
                                     << Text( i_rKept.pixel( Worst ) );
}

testing::AssertionResult MatchesGolden( const QImage& i_rImage, const std::string& i_rName,
                                        const VGoldenTolerance& i_rTolerance )
{
  const QImage Image = i_rImage.convertToFormat( QImage::Format_RGB32 );
  if ( IsUpdating() )
  {
    std::filesystem::create_directories( KeptPath( i_rName ).parent_path() );
    return Save( Image, KeptPath( i_rName ) ) ? testing::AssertionSuccess()
                                              : testing::AssertionFailure() << "cannot write " << KeptPath( i_rName );
  }
  const QImage Kept( QString::fromStdString( KeptPath( i_rName ).string() ) );
  QImage Differences;
  testing::AssertionResult Result = Kept.isNull()
                                        ? testing::AssertionFailure() << "nothing is kept at " << KeptPath( i_rName )
                                        : SamePicture( Image, Kept, i_rTolerance, &Differences );
  if ( !Result )
  {
    const std::filesystem::path Seen = LeftPath( i_rName, "" );
    Save( Image, Seen );
    if ( !Differences.isNull() )
    {
      Save( Differences, LeftPath( i_rName, "-difference" ) );
    }
    Result << " (" << i_rName << "; see " << Seen << ")";
  }
  return Result;
}

} // namespace TestSupport
