// A list control on such an account.
#pragma once

#include "controls/listimage/ctrlListImage.h"
#include "fakes/FakeListView.h"
#include "unit/ControlFixture.h"

namespace tarnwick {

class ListImageTest : public ControlTest {
 protected:
  void List(std::vector<File> files, TextView filter = u"*") {
    account = std::move(files);
    fake.apartment.listing.isCurrent = false;
    ASSERT_TRUE(control.Init(filter));
    log.clear();
  }
  std::string Names() const {
    std::string names;
    for (std::size_t i = 0; i < control.ItemCount(); ++i) names += Utf8FromText(control.ItemText(i, 0)) + ",";
    return names;
  }

  FakeListView view{log};
  ctrlListImage control{parts, view};
};

}  // namespace tarnwick
