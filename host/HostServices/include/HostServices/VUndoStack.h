#pragma once

#include <QtCore/QString>
#include <QtGui/QUndoStack>

#include <functional>

namespace HostServices
{

/// The undo stack of the host: a step is a text and two functions. Thread: GUI.
class VUndoStack
{
public:
  /// Runs `i_Redo` now and keeps the step. With a merge key that is that of the newest step, and not empty, the two
  /// become one: undone by the older one's `i_Undo`, redone by the newer one's `i_Redo`.
  void Push( const QString& i_rText, std::function< void() > i_Redo, std::function< void() > i_Undo,
             const QString& i_rMergeKey = {} );
  void Undo() { m_Stack.undo(); }
  void Redo() { m_Stack.redo(); }
  /// For menus, whose actions it makes.
  QUndoStack& Stack() { return m_Stack; }

private:
  QUndoStack m_Stack;
};

} // namespace HostServices
