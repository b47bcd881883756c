// Torture table: the separable row and column pipelines. Row members: the
// entries of dst are tested after the size, a 3-channel border-value array
// too; column members test their buffer after the destination step.
#include "torture/torture.h"

TORTURE_FAMILY(sepfilter) {
  return {
      TORTURE(zeliFilterRowBorderPipeline_16s_C1R, "in1 rout1 roi arr=3,1 =3 =1 border=1 =0 =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_16s_C3R, "in3 rout3 roi arr=3,1 =3 =1 border=1 arr=3,0:@s =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_16u_C1R, "in1 rout1 roi arr=3,1 =3 =1 border=1 =0 =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_16u_C3R, "in3 rout3 roi arr=3,1 =3 =1 border=1 arr=3,0:@s =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_8u16s_C1R, "in1 rout1 roi arr=3,1 =3 =1 border=1 =0 =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_8u16s_C3R, "in3 rout3 roi arr=3,1 =3 =1 border=1 arr=3,0:@s =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_Low_16s_C1R, "in1 rout1 roi arr=3,1 =3 =1 border=1 =0 =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_Low_16s_C3R, "in3 rout3 roi arr=3,1 =3 =1 border=1 arr=3,0:@s =1 buf"),
      TORTURE(zeliFilterRowBorderPipeline_32f_C1R, "in1 rout1 roi arr=3,1 =3 =1 border=1 =0 buf"),
      TORTURE(zeliFilterRowBorderPipeline_32f_C3R, "in3 rout3 roi arr=3,1 =3 =1 border=1 arr=3,0:@s buf"),

      TORTURE(zeliFilterColumnPipeline_16s_C1R, "rin1+2 out1 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16s_C3R, "rin3+2 out3 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16s8s_C1R, "rin1+2 out1 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16s8s_C3R, "rin3+2 out3 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16s8u_C1R, "rin1+2 out1 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16s8u_C3R, "rin3+2 out3 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16u_C1R, "rin1+2 out1 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_16u_C3R, "rin3+2 out3 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_Low_16s_C1R, "rin1+2 out1 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_Low_16s_C3R, "rin3+2 out3 roi arr=3,1 =3 =1 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_32f_C1R, "rin1+2 out1 roi arr=3,1 =3 buf:@t"),
      TORTURE(zeliFilterColumnPipeline_32f_C3R, "rin3+2 out3 roi arr=3,1 =3 buf:@t"),

      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_16s_C1R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_16s_C3R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_16u_C1R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_16u_C3R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_32f_C1R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_32f_C3R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_8u16s_C1R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_8u16s_C3R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_Low_16s_C1R, "roi =3 res"),
      TORTURE(zeliFilterRowBorderPipelineGetBufferSize_Low_16s_C3R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16s_C1R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16s_C3R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16s8s_C1R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16s8s_C3R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16s8u_C1R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16s8u_C3R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16u_C1R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_16u_C3R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_32f_C1R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_32f_C3R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_Low_16s_C1R, "roi =3 res"),
      TORTURE(zeliFilterColumnPipelineGetBufferSize_Low_16s_C3R, "roi =3 res"),
  };
}
