#include "navmisc/records/templates.h"

#include <gtest/gtest.h>

#include <tuple>

#include "navmisc/platform/files.h"
#include "testutil.h"

using navmisc::testutil::ProgPathScope;
using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST(Templates, CatalogueIsLocalisedAndResolved) {
  TempDir prog;
  ProgPathScope scope(prog.path());
  MakeDir(prog / L"Templates");
  WriteFileBytes(prog / L"Templates/TEMP.INI",
                 "[templates]\ntemp_count=3\n"
                 "[temp.0]\nname=T_NAME\ndesc=T_DESC\nthumb=.\\thumbs\\a.png\nlandmark=/abs/l.png\n"
                 "landmark_w=120\nMode=2\nStyle=101\n@vorla=1\n"
                 "[temp.1]\nname=T2_NAME\ndesc=NOWHERE\nStyle=5\n"
                 "[temp.2]\n"
                 "[L10N.DEFAULT]\nT_NAME=Classic\nT_DESC=Plain page\nT2_NAME=Modern\n"
                 "[L10N.de]\nT_NAME=Klassisch\nT_DESC=\n");
  FreeTemplateInfo();
  ASSERT_EQ(ReadTemplateInfo(L"de"), 3);
  auto* t0 = static_cast<TEMPLATE_ITEM_INFO*>(g_plTemplateItemList.GetHead());
  // An empty translation falls back to the default language; ".\" stands for the catalogue's
  // folder.
  EXPECT_EQ(std::tie(t0->name, t0->description, t0->thumbnailPath, t0->landmarkPath),
            std::tuple(L"Klassisch", L"Plain page", (prog / L"Templates") + L"/thumbs/a.png",
                       L"/abs/l.png"));
  EXPECT_EQ(std::tuple(t0->landmarkWidth, t0->mode, t0->wideStyle, t0->brandedLabel),
            std::tuple(120, 2, true, true));
  auto* t1 = static_cast<TEMPLATE_ITEM_INFO*>(g_plTemplateItemList.GetAt(g_plTemplateItemList.FindIndex(1)));
  EXPECT_EQ(t1->name, L"Modern");
  EXPECT_TRUE(t1->description.IsEmpty()) << "no entry in either language";
  EXPECT_FALSE(t1->wideStyle);
  EXPECT_EQ(ReadTemplateInfo(L"fr"), 6) << "reading again appends";
  FreeTemplateInfo();
  EXPECT_TRUE(g_plTemplateItemList.IsEmpty());
}
