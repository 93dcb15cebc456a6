#pragma once

#include <functional>
#include <string>
#include <vector>

#include "ui/controls/KControl.h"

// A chooser of one file, over the editor: the folder's path at the top (a click on it types
// another), below it the way up (".."), the folder's sub-folders and the files whose names end
// in one of the extensions (in any case); hidden entries are left out. A click selects, a
// double click or Return opens a folder or chooses a file, Backspace goes up, Escape or
// "Cancel" closes it without a choice. It takes the whole window, so nothing under it is
// reached while it is open. Folders are listed through the platform layer; one that cannot be
// listed shows why in place of its entries.
class KFileChooser final : public KControl {
public:
  using Choose = std::function<void(const std::string& path)>;  // UTF-8
  struct Entry {
    std::string name;  // ".." for the way up
    bool folder;
  };
  static constexpr int32_t kRowHeight = 20;

  KFileChooser(const KRect& window, KString title, const std::string& folder, std::vector<std::string> extensions, Choose choose);

  const std::string& Folder() const noexcept { return folder_; }
  const std::vector<Entry>& Entries() const noexcept { return entries_; }
  int32_t Selected() const noexcept { return selected_; }
  // Why the folder could not be listed; empty when it was.
  const KString& Problem() const noexcept { return problem_; }
  // Shows a folder (a path ending in the separator, or not).
  void Show(const std::string& folder);
  // What a double click does on an entry: into a folder, up, or choose the file and close.
  void Activate(int32_t index);

  // Where things are drawn: the path, entry `index` (an empty rectangle when scrolled out of
  // view), and the two buttons.
  const KRect& PathArea() const noexcept { return path_; }
  KRect RowArea(int32_t index) const noexcept;
  const KRect& OpenButton() const noexcept { return open_; }
  const KRect& CancelButton() const noexcept { return cancel_; }

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  bool OnDoubleClick(const KMouseEvent& event) override;
  bool OnWheel(const KMouseEvent& event) override;
  bool OnKey(const KKeyEvent& event) override;
  bool IsFocusable() const noexcept override { return true; }
  KString HelpKey() const override { return KString("filechooser"); }

private:
  int32_t VisibleRows() const noexcept;
  int32_t RowAt(KPoint at) const noexcept;
  void Select(int32_t index);
  void EditPath();
  void Close();

  KString title_;
  std::vector<std::string> extensions_;
  Choose choose_;
  std::string folder_;
  std::vector<Entry> entries_;
  KString problem_;
  int32_t selected_ = -1;
  int32_t first_ = 0;  // the entry in the top row
  KRect card_, path_, list_, open_, cancel_;
};
