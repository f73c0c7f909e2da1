import QtQuick

// The labels of what lies under the pointer, beside the pointer and always inside the view.
Item {
    id: root

    property string text
    property point pointer
    readonly property int offset: 10
    readonly property int margin: 6

    Rectangle {
        visible: root.text !== ""
        width: label.implicitWidth + 2 * root.margin
        height: label.implicitHeight + 2 * root.margin
        x: Math.max(0, Math.min(root.pointer.x + root.offset, root.width - width))
        y: Math.max(0, Math.min(root.pointer.y + root.offset, root.height - height))
        radius: 5
        color: "#A0000000"

        Text {
            id: label

            anchors.centerIn: parent
            text: root.text
            textFormat: Text.StyledText
            color: "#F0F0F0"
            font.pixelSize: 13
        }
    }
}
