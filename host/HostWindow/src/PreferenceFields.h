#pragma once

// moc trips over the standard library's concepts unless Qt comes first.
#include <QtWidgets/QWidget>

#include "PreferenceItems.h"

namespace HostWindow
{

/// Shows the value of one preference and takes another from the operator. What it shows does not come back as an edit.
class VPreferenceField : public QWidget
{
  Q_OBJECT

public:
  using QWidget::QWidget;

  virtual void Show( const ZEK::VTypedValue& i_rValue ) = 0;
  /// Unfinished text gives way to the value shown last; false when there was none.
  virtual bool Revert() { return false; }
  /// Whether it carries the text of the preference itself.
  virtual bool HasText() const { return false; }
  virtual void SetText( const QString& ) {}

signals:
  void Edited( const ZEK::VTypedValue& i_rValue );
  void Refused( const QString& i_rWhy );
};

/// The field that suits the preference: a check box for a switch, a box of choices, a spin box for a number, a folder
/// with a button, or a line of text.
VPreferenceField* MakePreferenceField( const VPreferenceItem& i_rItem, QWidget* i_pParent );

} // namespace HostWindow
