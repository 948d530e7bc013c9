#define N 0x1F
STATE "grÃ¼ÃŸe şÃ!" N -3 <= x_1 $ 12ab
