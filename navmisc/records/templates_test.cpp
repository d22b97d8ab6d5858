#include "navmisc/records/templates.h"

#include <gtest/gtest.h>

#include "navmisc/platform/files.h"
#include "navmisc/platform/shared_globals.h"
#include "testutil.h"

using navmisc::testutil::TempDir;
using navmisc::testutil::WriteFileBytes;

TEST(Templates, CatalogueIsLocalisedAndResolved) {
  TempDir prog;
  const CString previous = g_szExecProgPath;
  navmisc::SetSharedText(g_szExecProgPath, prog.path());
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
  EXPECT_EQ(t0->name, L"Klassisch");
  EXPECT_EQ(t0->description, L"Plain page") << "an empty translation falls back";
  EXPECT_EQ(t0->thumbnailPath, (prog / L"Templates") + L"/thumbs/a.png");
  EXPECT_EQ(t0->landmarkPath, L"/abs/l.png");
  EXPECT_EQ(t0->landmarkWidth, 120);
  EXPECT_EQ(t0->mode, 2);
  EXPECT_TRUE(t0->wideStyle);
  EXPECT_TRUE(t0->brandedLabel);
  auto* t1 = static_cast<TEMPLATE_ITEM_INFO*>(g_plTemplateItemList.GetAt(g_plTemplateItemList.FindIndex(1)));
  EXPECT_EQ(t1->name, L"Modern");
  EXPECT_TRUE(t1->description.IsEmpty()) << "no entry in either language";
  EXPECT_FALSE(t1->wideStyle);
  EXPECT_EQ(ReadTemplateInfo(L"fr"), 6) << "reading again appends";
  FreeTemplateInfo();
  EXPECT_TRUE(g_plTemplateItemList.IsEmpty());
  navmisc::SetSharedText(g_szExecProgPath, previous);
}
