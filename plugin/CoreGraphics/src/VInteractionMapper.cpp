#include <CoreGraphics/VInteractionMapper.h>

#include <QtCore/Qt>

namespace CoreGraphics
{
namespace
{
std::shared_ptr< VInteractionMapper >& Mapper()
{
  static std::shared_ptr< VInteractionMapper > pMapper;
  return pMapper;
}
} // namespace

bool VInteractionMapper::IsAction( int i_Action, int i_Buttons, int i_Modifiers ) const
{
  const bool bLeft = i_Buttons & Qt::LeftButton;
  const bool bRight = i_Buttons & Qt::RightButton;
  const bool bMiddle = i_Buttons & Qt::MiddleButton;
  const unsigned Held =
      unsigned( i_Modifiers ) & ( Qt::ShiftModifier | Qt::ControlModifier | Qt::AltModifier | Qt::MetaModifier );
  switch ( i_Action )
  {
  case EInteractionPan:
    return Held == 0 && bLeft && ( bRight || bMiddle );
  case EInteractionOrbit:
    return Held == 0 && bLeft && !bRight && !bMiddle;
  case EInteractionZoom:
    return Held == 0 && bRight && !bLeft && !bMiddle;
  case EInteractionBand:
    return Held == Qt::AltModifier && ( bLeft || bRight || bMiddle );
  default:
    return false;
  }
}

void SetInteractionMapper( std::shared_ptr< VInteractionMapper > i_pMapper )
{
  Mapper() = std::move( i_pMapper );
}

std::shared_ptr< VInteractionMapper > InteractionMapper()
{
  return Mapper();
}

bool IsInteraction( int i_Action, int i_Buttons, int i_Modifiers )
{
  const auto& rpMapper = Mapper();
  return rpMapper && rpMapper->IsAction( i_Action, i_Buttons, i_Modifiers );
}

} // namespace CoreGraphics
