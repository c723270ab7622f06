#define OK 1
sound ]
